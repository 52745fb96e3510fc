// tonewright record
#pragma once

#include "library/Library.h"
#include "media/FormatOptions.h"
#include "terminal/Progress.h"

#include <filesystem>
#include <string>

namespace host {

struct SRecordOptions : SFormatOptions {
    std::filesystem::path output;
    std::string device; // its id; empty for the default device
    double seconds = 0; // 0: until stopped
    bool force = false;
    EOutput show = EOutput::normal;
};

// Returns an exit code.
int record(CLibrary& library, const SRecordOptions& options);

} // namespace host
