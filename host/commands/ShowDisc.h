// tonewright disc
#pragma once

#include <filesystem>

namespace host {

// An empty place stands for the first drive with a disc. Returns an exit code; throws std::runtime_error.
int showDisc(const std::filesystem::path& place, bool json);

} // namespace host
