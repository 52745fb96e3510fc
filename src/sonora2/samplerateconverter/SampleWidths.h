// Sample width conversion and interleaving: the dense loops around the filter.
#pragma once

#include <array>
#include <cstdint>

namespace sonora2::samplerateconverter {

// Little-endian samples of 1 (unsigned), 3 or 4 bytes to 16 bits; the lower bytes are dropped. 2 bytes are
// copied. `bytes` need not be aligned.
void widenToShort(const uint8_t* bytes, int bytesPerSample, int64_t samples, int16_t* out);

// Planes to interleaved frames of 1, 2, 3 or 6 channels.
void interleave(const std::array<const int16_t*, 6>& planes, int channels, int frames, int16_t* out);
void interleave(const std::array<const int32_t*, 6>& planes, int channels, int frames, int32_t* out);

// Little-endian samples of 1 (unsigned) to 4 bytes to the upper bits of 32.
void widenToInt(const uint8_t* bytes, int bytesPerSample, int64_t samples, int32_t* out);

// 32 bits to 3 bytes, rounded.
void narrowTo24(const int32_t* samples, int64_t count, uint8_t* out);

// 16 bits to unsigned 8 bits.
void narrowToByte(const int16_t* samples, int64_t count, uint8_t* out);

} // namespace sonora2::samplerateconverter
