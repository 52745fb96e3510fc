// tonewright burn
#pragma once

#include "library/Library.h"
#include "media/DiscProject.h"
#include "terminal/Progress.h"

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace host {

struct SBurnOptions {
    std::vector<std::filesystem::path> inputs;
    std::filesystem::path image;         // either this
    std::filesystem::path drive;         // or this
    std::optional<EDiscContent> content; // by default that of the image's type, or what the inputs suggest
    std::optional<double> gap;           // seconds
    std::string title;
    bool cdText = false;
    bool dummy = false;
    bool blank = false;
    double speed = 0; // 0: the fastest
    bool force = false;
    EOutput show = EOutput::normal;
};

// Returns an exit code; throws CUsageError for options that contradict each other.
int burn(CLibrary& library, const SBurnOptions& options);

} // namespace host
