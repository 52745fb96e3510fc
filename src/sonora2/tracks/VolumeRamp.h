// A gain that changes along the samples of a chunk.
#pragma once

#include <cstdint>

namespace sonora2::audio {

struct SVolumeChange;

// Where a chunk stands and what it holds.
struct SRampChunk {
    int16_t* samples;
    int64_t frames;
    int channels;
    int rate;
    double timestamp;
};

// Does nothing unless the chunk lies wholly within the change.
void applyVolumeChange(const SVolumeChange& change, const SRampChunk& chunk);

} // namespace sonora2::audio
