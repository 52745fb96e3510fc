// Where the sound of an MPEG audio file ends.
#pragma once

#include <cstdint>
#include <cstdio>

namespace sonora2::plugins {

// Offset behind the last frame: tags at the end (ID3, APE, Lyrics3) can contain what looks like frames. The
// size in a Xing or LAME header is used as well if no frame follows the sound that it describes.
// Leaves the file at its start.
int64_t findSoundEnd(std::FILE* file);

// Returns the offset behind all tags that start at `offset`, one after the other.
int64_t skipTags(std::FILE* file, int64_t offset);

} // namespace sonora2::plugins
