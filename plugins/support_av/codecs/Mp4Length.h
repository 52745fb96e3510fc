// The exact length of a track in an MPEG-4 file.
#pragma once

#include <cstdint>
#include <cstdio>

namespace sonora2::plugins::av {

// The media's own duration, which counts frames of sound. Edit lists, from which libav takes the length,
// count in units of the whole file, often milliseconds. `track` is the index of the track. In ticks of the
// track; 0 if there is none.
int64_t readMediaDuration(std::FILE* file, int track);

} // namespace sonora2::plugins::av
