// The sum of two sounds.
#pragma once

#include "sonora2/Api.h"

#include <cstddef>
#include <cstdint>

namespace sonora2::audio {

// Mixes 16-bit samples into a sum. Two samples of one sign are added and lose their product over full scale,
// so that no sum leaves the range; the divisions truncate toward zero:
//   both negative: b + a + a * b / 32768
//   both positive: b + a - a * b / 32767
//   otherwise:     b + a
// The two ranges do not overlap.
SONORA2_API void mixSamples(const int16_t* samples, int16_t* sum, size_t count);

} // namespace sonora2::audio
