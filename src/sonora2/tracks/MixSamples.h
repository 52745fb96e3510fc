// The sum of two sounds.
#pragma once

#include "sonora2/Api.h"

#include <cstddef>
#include <cstdint>

namespace sonora2::audio {

// Mixes 16-bit samples into a sum. For two samples of equal sign, their product over full scale is
// subtracted, so that the sum stays in range; divisions truncate toward zero:
//   both negative: b + a + a * b / 32768
//   both positive: b + a - a * b / 32767
//   otherwise:     b + a
// The two arrays must not overlap.
SONORA2_API void mixSamples(const int16_t* samples, int16_t* sum, size_t count);

} // namespace sonora2::audio
