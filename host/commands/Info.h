// tonewright info
#pragma once

#include "library/Library.h"

#include <filesystem>
#include <vector>

namespace host {

// Returns an exit code.
int showInfo(CLibrary& library, const std::vector<std::filesystem::path>& files, bool json);

} // namespace host
