// tonewright play
#pragma once

#include "library/Library.h"
#include "terminal/Progress.h"

#include <filesystem>
#include <vector>

namespace host {

struct SPlayOptions {
    std::vector<std::filesystem::path> files;
    EOutput show = EOutput::normal;
};

// Returns an exit code.
int play(CLibrary& library, const SPlayOptions& options);

} // namespace host
