// tonewright formats
#pragma once

#include "library/Library.h"

namespace host {

struct SFormatsOptions {
    bool table = false; // what can be read, written and tagged, not only the names
    bool json = false;
};

// Returns an exit code.
int listFormats(CLibrary& library, const SFormatsOptions& options);

} // namespace host
