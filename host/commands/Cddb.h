// tonewright cddb
#pragma once

#include "media/CddbLookup.h"

#include <filesystem>
#include <optional>

namespace host {

struct SCddbOptions : SCddbAccess {
    std::optional<SDiscToc> toc; // otherwise that of the input
    std::filesystem::path input; // a drive, a disc image or a cue sheet; empty: the first drive with a disc
    int pick = 0;                // from 1 on; 0 asks
    bool list = false;
    bool json = false;
};

// Returns an exit code.
int lookUpDisc(const SCddbOptions& options);

} // namespace host
