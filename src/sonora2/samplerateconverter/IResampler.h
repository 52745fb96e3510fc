// The filter behind the sample rate converter: one channel of 16-bit or 32-bit samples. It is in a library of
// its own (resampler/), since what it depends on takes longer to load than most jobs that never resample.
#pragma once

#include "peru/P.h"
#include "sonora2/Api.h"

namespace sonora2::samplerateconverter {

using peru::P;

// One thread at a time.
class SONORA2_API IResampler : public virtual peru::IBase {
public:
    // Filters the input; sizes are in samples of the width given to create(). Returns the number of samples
    // written, at most `dstSize`, or -1 when out of memory; `consumed` receives the number of samples taken,
    // which is less than `srcSize` only if the output would not hold the result. The filter keeps its own
    // history: consumed samples must not be passed again. The output does not depend on how the input is
    // split into calls.
    virtual int run(void* dst, const void* src, int* consumed, int srcSize, int dstSize) = 0;
};

class SONORA2_API IResamplerLibrary : public virtual peru::IBase {
public:
    // Creates a polyphase filter of `filterSize` taps (more when downsampling) with 2^phaseShift phases.
    // `linear` interpolates between phases; `cutoff` is relative to the lower Nyquist frequency. Empty if a
    // rate is not positive, the rates differ by a factor of 1024 or more, or memory runs out. With
    // TONEWRIGHT_RESAMPLER=best in the environment a filter of the highest quality is used instead, where the
    // platform's library has one. Any thread.
    virtual P<IResampler> create(int outRate, int inRate, int filterSize, int phaseShift, int linear,
                                 double cutoff, int bytesPerSample) = 0;
};

// The function "sonora2_getResamplerLibrary" that the library exports.
inline constexpr const char* kGetResamplerLibraryName = "sonora2_getResamplerLibrary";

// Loads the library on first use. Throws CError if it is missing or cannot be loaded. Any thread.
SONORA2_API const P<IResamplerLibrary>& getResamplerLibrary();

} // namespace sonora2::samplerateconverter
