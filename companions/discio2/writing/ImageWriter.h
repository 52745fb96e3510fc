// Writes projects to disc images. Everything is read back and compared before it replaces what was there.
#pragma once

#include "projects/VirtualAudioDisc.h"
#include "projects/VirtualDataDisc.h"
#include "writing/Progress.h"

namespace discio {

// A cue sheet with the samples beside it. Throws CDiscError.
void writeAudioImage(const CVirtualAudioDisc& disc, const std::string& path, bool withTexts,
                     const CProgress& progress);
// An ISO 9660 file system with Joliet and Rock Ridge. Throws CDiscError.
void writeDataImage(const CVirtualDataDisc& disc, const std::string& path, const CProgress& progress);

// Throws CDiscError unless the file's extension is this one, in small or capital letters.
void requireExtension(const std::string& path, const char* extension);

} // namespace discio
