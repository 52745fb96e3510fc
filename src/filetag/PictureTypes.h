// Between the picture types of the program and the numbers in the files.
#pragma once

#include "filetag/ICoverArt.h"

namespace filetag {

// The number of the ID3v2 APIC frame, which FLAC, Vorbis and ASF pictures share.
int32_t toFileNumber(EPictureType type);
EPictureType fromFileNumber(int32_t number);

} // namespace filetag
