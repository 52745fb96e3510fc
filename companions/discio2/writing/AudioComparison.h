// Compares what a drive has written with the project.
#pragma once

#include "Medium.h"
#include "writing/Progress.h"

namespace discio {

// Drives place audio some frames earlier or later than they were told, and read it so. The same small shift
// is accepted for all tracks; what it moves over the border of a track is not compared. Throws CDiscError if
// the tracks differ otherwise, or in their places.
void compareAudio(const IMedium& expected, const IMedium& written, const std::string& name,
                  const CProgress& progress);

} // namespace discio
