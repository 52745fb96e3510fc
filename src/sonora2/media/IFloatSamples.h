// Floating-point samples that pass from a source to a format unchanged.
#pragma once

#include "peru/P.h"
#include "sonora2/Api.h"

namespace sonora2::common {

// Optional; found by an interface cast on a source or a format. Samples are integers unless both ends of a
// job agree on floating point: nothing in between (converters, tracks, hosts) may touch the samples then.
class SONORA2_API IFloatSamples : public virtual peru::IBase {
public:
    // Whether samples can be little-endian IEEE numbers of 4 or 8 bytes with full scale 1.0. An open source
    // returns true only for the samples that its file holds, and only if nobody has chosen the format that it
    // delivers.
    virtual bool canUseFloat(int bytesPerSample) = 0;
    // Samples are such numbers until the object is closed, and getBytesPerSample() returns their size. An
    // open source continues at the same frame; a format must be closed. Throws CSonoraError unless
    // canUseFloat().
    virtual void useFloat(int bytesPerSample) = 0;
};

} // namespace sonora2::common
