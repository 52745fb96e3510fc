// The headers of plain sound containers that no tag reader knows.
#pragma once

#include "AudioFile.h"

#include <optional>

namespace host {

// Of an AU, CAF, W64 or RF64 file, told by its first bytes; nothing of another kind or of a damaged one.
std::optional<SSampleFormat> readPlainHeader(const std::filesystem::path& file);

} // namespace host
