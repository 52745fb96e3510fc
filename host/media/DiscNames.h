// Names for a disc from a CDDB server.
#pragma once

#include "media/CddbLookup.h"
#include "media/Disc.h"

#include <optional>

namespace host {

// Looks the disc up and replaces its texts by those of the record, which the user chooses if several fit or
// none fits exactly; see chooseRecord(). Returns an exit code other than success if there was no choice, or
// after Ctrl-C. Throws std::runtime_error.
int nameDisc(CDisc& disc, const SCddbAccess& access, int pick);

} // namespace host
