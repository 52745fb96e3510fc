// tonewright loudness
#pragma once

#include "library/Library.h"
#include "media/Loudness.h"

#include <filesystem>
#include <vector>

namespace host {

struct SLoudnessOptions {
    std::vector<std::filesystem::path> inputs; // "-" is standard input
    bool recursive = false;
    double target = kDefaultTarget; // LUFS
    bool album = true;              // measures all inputs together, too
    bool tag = false;               // stores the gains in the files
    int jobs = 1;
    bool json = false;
};

// Returns an exit code.
int showLoudness(CLibrary& library, const SLoudnessOptions& options);

} // namespace host
