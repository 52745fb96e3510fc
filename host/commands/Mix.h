// tonewright mix
#pragma once

#include "library/Library.h"
#include "media/FormatOptions.h"
#include "terminal/Progress.h"

#include <filesystem>

namespace host {

struct SMixOptions : SFormatOptions {
    std::filesystem::path input;
    std::filesystem::path output;
    bool force = false;
    EOutput show = EOutput::normal;
};

// Returns an exit code.
int mix(CLibrary& library, const SMixOptions& options);

} // namespace host
