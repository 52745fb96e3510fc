// tonewright drives
#pragma once

#include "library/Library.h"

namespace host {

// All return an exit code.
int listDrives(bool json);
int watchDrives(CLibrary& library, bool json);

} // namespace host
