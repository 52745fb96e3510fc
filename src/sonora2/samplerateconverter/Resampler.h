// The filter behind the sample rate converter: one channel of 16-bit or 32-bit samples.
#pragma once

#include <cstdint>

namespace sonora2::samplerateconverter {

struct SResampler;

// Creates a polyphase filter of `filterSize` taps (more when downsampling) with 2^phaseShift phases. `linear`
// interpolates between phases; `cutoff` is relative to the lower Nyquist frequency. Null if a rate is not
// positive, the rates differ by a factor of 1024 or more, or memory runs out. With TONEWRIGHT_RESAMPLER=best
// in the environment a filter of the highest quality is used instead, where the platform's library has one.
SResampler* resamplerInit(int outRate, int inRate, int filterSize, int phaseShift, int linear, double cutoff,
                          int bytesPerSample);

// Filters the input; sizes are in samples of the width given to resamplerInit. Returns the number of samples
// written, at most `dstSize`, or -1 when out of memory; `consumed` receives the number of samples taken,
// which is less than `srcSize` only if the output would not hold the result. The filter keeps its own
// history: consumed samples must not be passed again. The output does not depend on how the input is split
// into calls.
int resamplerRun(SResampler* resampler, void* dst, const void* src, int* consumed, int srcSize, int dstSize);

void resamplerClose(SResampler* resampler); // null is allowed

} // namespace sonora2::samplerateconverter
