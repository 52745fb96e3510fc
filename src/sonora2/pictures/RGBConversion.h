// Conversion of luma and chroma to 32-bit pixels.
#pragma once

#include "sonora2/Api.h"

#include <cstddef>
#include <cstdint>

namespace sonora2::common {

// Loops that the compiler vectorises. The two conversions differ in the scale of their coefficients and in
// which component of chroma feeds which byte.

// Each pair of pixels is Y, U, Y, V.
SONORA2_API void convertPairsToRGB(const uint8_t* pairs, uint32_t* pixels, size_t pairCount);
// One row: two pixels for each sample of chroma.
SONORA2_API void convertRowToRGB(const uint8_t* luma, const uint8_t* u, const uint8_t* v, uint32_t* pixels,
                                 size_t pairCount);
// Whole planes; each plane of chroma has width / 2 by height / 2 samples. At an odd width or height the last
// samples of chroma also serve the pixels that have none.
void convertPlanesToRGB(const uint8_t* luma, const uint8_t* u, const uint8_t* v, uint32_t* pixels, int width,
                        int height);
void splitChroma(const uint8_t* interleaved, uint8_t* u, uint8_t* v, size_t count);

} // namespace sonora2::common
