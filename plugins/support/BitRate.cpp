#include "support/BitRate.h"

namespace sonora2::plugins {

void requireBitRate(const SMediaFile& file, const char* codec, const SPcmFormat& format, int bitRate,
                    const SBitRateRange& range) {
    if (bitRate == 0 || range.contains(bitRate)) return;
    // Users often state kilobits.
    const bool isLikelyKilo = range.contains(int64_t{bitRate} * 1000);
    fail("could not write %s: %d bit/s is %s the range of %s for %d Hz and %d channels, %d to %d bit/s%s",
         file.getDisplayName(), bitRate, bitRate < range.lowest ? "below" : "above", codec, format.rate,
         format.channels, range.lowest, range.highest,
         isLikelyKilo ? peru::format(" (%dk?)", bitRate) : peru::newString(""));
}

} // namespace sonora2::plugins
