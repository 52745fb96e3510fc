// Converts between the program's picture types and the numbers stored in files.
#pragma once

#include "filetag/ICoverArt.h"

namespace filetag {

// The file number is that of the ID3v2 APIC frame; FLAC, Vorbis and ASF pictures use the same numbers.
int32_t toFileNumber(EPictureType type);
EPictureType fromFileNumber(int32_t number);

} // namespace filetag
