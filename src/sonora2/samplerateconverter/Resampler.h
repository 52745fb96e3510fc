// The filter behind the sample rate converter: one channel of 16-bit samples.
#pragma once

#include <cstdint>

namespace sonora2::samplerateconverter {

struct SResampler;

// Creates a polyphase filter of `filterSize` taps (more when downsampling) with 2^phaseShift phases. `linear`
// interpolates between phases; `cutoff` is relative to the lower Nyquist frequency. Null if a rate is not
// positive, the rates differ by a factor of 1024 or more, or memory runs out.
SResampler* resamplerInit(int outRate, int inRate, int filterSize, int phaseShift, int linear, double cutoff);

// Filters the input. Returns the number of samples written, at most `dstSize`, or -1 when out of memory;
// `consumed` receives the number of samples taken, which is less than `srcSize` only if the output would not
// hold the result. The filter keeps its own history: consumed samples must not be passed again. The output
// does not depend on how the input is split into calls.
int resamplerRun(SResampler* resampler, int16_t* dst, const int16_t* src, int* consumed, int srcSize,
                 int dstSize);

void resamplerClose(SResampler* resampler); // null is allowed

} // namespace sonora2::samplerateconverter
