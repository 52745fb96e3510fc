// tonewright waveform
#pragma once

#include "library/Library.h"

#include <filesystem>

namespace host {

struct SWaveformOptions {
    std::filesystem::path input;
    std::filesystem::path output;
    int width = 1200;
    int height = 300;
    bool force = false;
};

// Returns an exit code.
int drawWaveform(CLibrary& library, const SWaveformOptions& options);

} // namespace host
