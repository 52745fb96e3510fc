// tonewright convert
#pragma once

#include "library/Library.h"
#include "media/FormatOptions.h"
#include "terminal/Progress.h"

#include <filesystem>
#include <string>
#include <vector>

namespace host {

struct SConvertOptions : SFormatOptions {
    std::vector<std::filesystem::path> inputs;
    std::filesystem::path output;    // for a single input
    std::string extension;           // or one output beside each input
    std::filesystem::path directory; // ... or in this folder
    int jobs = 1;
    bool force = false;
    bool carryTags = true;
    bool salvage = false;
    std::string resampler; // "default" or "best"; empty: as the environment says
    EOutput show = EOutput::normal;
};

// Returns an exit code.
int convert(CLibrary& library, const SConvertOptions& options);

} // namespace host
