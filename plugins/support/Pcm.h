// Conversion between PCM sample widths: plain loops over whole blocks that the compiler can vectorise.
#pragma once

#include <cstddef>
#include <cstdint>

namespace sonora2::plugins::pcm {

// Converts samples as stored in chunks (8 bit unsigned; 16, 24, 32 bit signed little-endian) to integers of
// the same range; 8-bit samples become -128 to 127.
void unpack(const uint8_t* pcm, int bytesPerSample, int32_t* samples, size_t count);
// The inverse. Excess high bits are dropped, not clipped: codecs deliver samples that are within range.
void pack(const int32_t* samples, uint8_t* pcm, int bytesPerSample, size_t count);

// One channel of interleaved samples; `stride` is the number of channels.
void unpackChannel(const uint8_t* pcm, int bytesPerSample, int stride, int32_t* samples, size_t frames);
// Interleaves planes; each sample is first shifted left by `shift`.
void packPlanes(const int32_t* const planes[], int channels, uint8_t* pcm, int bytesPerSample, size_t frames,
                int shift = 0);

// Maps -1.0 to 1.0 to the full range of the given width. Values outside are clipped, NaN becomes 0.
void packFloat(const float* samples, uint8_t* pcm, int bytesPerSample, size_t count);
void packPlanesFloat(const float* const planes[], int channels, uint8_t* pcm, int bytesPerSample,
                     size_t frames);
// Maps integers of the given width to -1.0 (inclusive) to 1.0 (exclusive).
void unpackChannelFloat(const uint8_t* pcm, int bytesPerSample, int stride, float* samples, size_t frames);

// Converts between unsigned and signed 8-bit samples in place.
void flipSign8(uint8_t* pcm, size_t count);

} // namespace sonora2::plugins::pcm
