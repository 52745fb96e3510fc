// tonewright convert
#pragma once

#include "library/Library.h"
#include "media/FormatOptions.h"
#include "media/NamePattern.h"
#include "terminal/Progress.h"

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace host {

enum class EExisting { refuse, replace, skip };

struct SConvertOptions : SFormatOptions {
    std::vector<std::filesystem::path> inputs; // "-" is standard input
    bool recursive = false;
    std::filesystem::path output;    // for a single input; "-" is standard output
    std::string extension;           // or one output beside each input
    std::filesystem::path directory; // ... or in this folder
    std::optional<CNamePattern>
        names; // names the outputs of `extension`; otherwise they have the inputs' names
    int jobs = 1;
    EExisting existing = EExisting::refuse;
    bool dryRun = false;
    bool carryTags = true;
    bool carryTimes = false;
    bool salvage = false;
    bool preventClipping = false;
    std::optional<double> loudness; // of the outputs, in LUFS
    bool oneGain = false;           // ... of all together
    bool allowClipping = false;     // by the gain for it
    std::string resampler;          // "default" or "best"; empty: as the environment says
    EOutput show = EOutput::normal;
};

// Returns an exit code.
int convert(CLibrary& library, const SConvertOptions& options);

} // namespace host
