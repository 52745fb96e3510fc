// tonewright rip
#pragma once

#include "library/Library.h"
#include "media/CddbLookup.h"
#include "media/FormatOptions.h"
#include "media/NamePattern.h"
#include "terminal/Progress.h"

#include <optional>
#include <set>

namespace host {

struct SRipOptions : SFormatOptions {
    std::filesystem::path place; // a drive or disc image; empty: the first drive with a disc
    std::set<int> tracks;        // empty: all; 0: the sound before track 1
    std::string extension = "flac";
    std::filesystem::path directory;
    std::optional<CNamePattern> names;
    std::optional<SCddbAccess> cddb; // where to look up the names
    int pick = 0;                    // of the records, from 1 on; 0 asks
    bool verify = false;
    bool writeCue = false;
    int jobs = 1; // for disc images
    bool force = false;
    EOutput show = EOutput::normal;
};

// Returns an exit code; throws std::runtime_error if the disc cannot be read.
int rip(CLibrary& library, const SRipOptions& options);

} // namespace host
