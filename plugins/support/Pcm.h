// Widths of PCM samples. Plain loops over whole blocks, written so that the compiler vectorises them.
#pragma once

#include <cstddef>
#include <cstdint>

namespace sonora2::plugins::pcm {

// Samples as they lie in chunks (8 bit unsigned; 16, 24, 32 bit signed little-endian) to integers of the
// same range, so that 8 bit gives -128 to 127.
void unpack(const uint8_t* pcm, int bytesPerSample, int32_t* samples, size_t count);
// The other way. What does not fit is cut off, not clipped: samples come from codecs that keep their range.
void pack(const int32_t* samples, uint8_t* pcm, int bytesPerSample, size_t count);

// One channel of interleaved samples; `stride` is the number of channels.
void unpackChannel(const uint8_t* pcm, int bytesPerSample, int stride, int32_t* samples, size_t frames);
// Planes to interleaved samples, each shifted left by `shift` first.
void packPlanes(const int32_t* const planes[], int channels, uint8_t* pcm, int bytesPerSample, size_t frames,
                int shift = 0);

// Full range -1.0 to 1.0 to integers of that width; what lies outside is clipped, NaN becomes silence.
void packFloat(const float* samples, uint8_t* pcm, int bytesPerSample, size_t count);
void packPlanesFloat(const float* const planes[], int channels, uint8_t* pcm, int bytesPerSample,
                     size_t frames);
// Integers of that width to -1.0 (inclusive) to 1.0 (exclusive).
void unpackChannelFloat(const uint8_t* pcm, int bytesPerSample, int stride, float* samples, size_t frames);

// Between unsigned and signed 8 bit samples, in place.
void flipSign8(uint8_t* pcm, size_t count);

} // namespace sonora2::plugins::pcm
