// The filter behind the sample rate converter: one channel of 16-bit samples.
#pragma once

#include <cstdint>

namespace sonora2::samplerateconverter {

struct SResampler;

// Makes a polyphase filter of `filterSize` taps (more when the rate falls) with 2^phaseShift phases. `linear`
// interpolates between phases; `cutoff` is relative to the lower Nyquist frequency. Null when a rate is not
// positive, the rates differ by more than a factor of 1024, or memory is short.
SResampler* resamplerInit(int outRate, int inRate, int filterSize, int phaseShift, int linear, double cutoff);

// Filters what comes and what an earlier call left. Answers the samples written, `dstSize` at most, or -1
// when memory is short; `consumed` tells the samples taken, which are all unless the output would not hold
// them. The filter keeps its own history: a consumed sample is not to be given again. The output does not
// depend on how the input is cut into calls.
int resamplerRun(SResampler* resampler, int16_t* dst, const int16_t* src, int* consumed, int srcSize,
                 int dstSize);

void resamplerClose(SResampler* resampler); // null is allowed

} // namespace sonora2::samplerateconverter
