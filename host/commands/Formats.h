// tonewright formats
#pragma once

#include "library/Library.h"

namespace host {

// Returns an exit code.
int listFormats(CLibrary& library, bool json);

} // namespace host
