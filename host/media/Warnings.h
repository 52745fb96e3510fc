// What decoders report without failing.
#pragma once

#include "library/Library.h"
#include "terminal/Progress.h"

#include <filesystem>

namespace host {

// Reports the decoder's warnings since the last call; `input` is the file as opened.
void reportWarnings(const CHandle& source, const std::filesystem::path& input, CProgress& progress,
                    CProgress::Job job);

// Forgets them, before the sound is read once more.
void dropWarnings(const CHandle& source);

} // namespace host
