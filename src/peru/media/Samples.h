// What happens to samples between the system and this library.
#pragma once

#include "peru/media/Api.h"

#include <cstdint>
#include <optional>

namespace peru::media {

// Samples are signed, little-endian and packed, as the engine has them, of 1, 2 or 3 bytes. None of these
// allocates, waits or throws.

// Multiplies every sample and rounds; what leaves the range stays at its end. Other widths stay as they are.
PERU_MEDIA_API void scaleSamples(void* samples, int64_t size, int32_t bytesPerSample, double gain);

// Between the signed 8-bit samples of the engine and the unsigned ones of this library, in both directions.
PERU_MEDIA_API void flipSigns(void* samples, int64_t size);

struct SLevels {
    double left = 0.0;
    double right = 0.0;
};

// The levels of one frame, from 0.0 to 1.0. Mono gives both the same; nothing for more than two channels.
// Three bytes read as silence.
PERU_MEDIA_API std::optional<SLevels> readLevels(const void* frame, int32_t bytesPerSample,
                                                 int32_t channelCount);

} // namespace peru::media
