// Conversion of samples between the sound system and this library.
#pragma once

#include "peru/media/Api.h"

#include <cstdint>
#include <optional>

namespace peru::media {

// Samples are signed, little-endian and packed, of 1, 2 or 3 bytes, as in the engine. None of these functions
// allocates, blocks or throws.

// Multiplies and rounds every sample, clamping to the range. Other sample widths are left unchanged.
PERU_MEDIA_API void scaleSamples(void* samples, int64_t size, int32_t bytesPerSample, double gain);

// Converts between the engine's signed 8-bit samples and this library's unsigned ones, in either direction.
PERU_MEDIA_API void flipSigns(void* samples, int64_t size);

struct SLevels {
    double left = 0.0;
    double right = 0.0;
};

// The levels of one frame, from 0.0 to 1.0. Both are equal for mono; no result for more than two channels.
// Three-byte samples give 0.0.
PERU_MEDIA_API std::optional<SLevels> readLevels(const void* frame, int32_t bytesPerSample,
                                                 int32_t channelCount);

} // namespace peru::media
