// Applies a changing gain to the samples of a chunk.
#pragma once

#include <cstdint>

namespace sonora2::audio {

struct SVolumeChange;

// A chunk's samples, format and position.
struct SRampChunk {
    int16_t* samples;
    int64_t frames;
    int channels;
    int rate;
    double timestamp;
};

// Does nothing unless the chunk lies entirely within the change.
void applyVolumeChange(const SVolumeChange& change, const SRampChunk& chunk);

} // namespace sonora2::audio
