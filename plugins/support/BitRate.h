// Bit rates that a codec supports.
#pragma once

#include "support/MediaFile.h"

namespace sonora2::plugins {

struct SBitRateRange {
    int lowest = 0; // bits per second
    int highest = 0;

    bool contains(int64_t bitRate) const { return bitRate >= lowest && bitRate <= highest; }
};

// Throws if the bit rate is outside of the codec's range for this format; 0 stands for none.
void requireBitRate(const SMediaFile& file, const char* codec, const SPcmFormat& format, int bitRate,
                    const SBitRateRange& range);

} // namespace sonora2::plugins
