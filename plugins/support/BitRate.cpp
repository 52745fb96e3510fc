#include "support/BitRate.h"

namespace sonora2::plugins {

void requireBitRate(const SMediaFile& file, const char* codec, const SPcmFormat& format, int bitRate,
                    const SBitRateRange& range) {
    if (bitRate == 0 || range.contains(bitRate)) return;
    // Users often state kilobits.
    const bool isLikelyKilo = range.contains(int64_t{bitRate} * 1000);
    constexpr peru::SLocalizedText kBelow{
        "sonora2.plugins.bitRateBelow",
        "could not write %s: %d bit/s is below the range of %s for %d Hz and %d channels, %d to %d bit/s%s"};
    constexpr peru::SLocalizedText kAbove{
        "sonora2.plugins.bitRateAbove",
        "could not write %s: %d bit/s is above the range of %s for %d Hz and %d channels, %d to %d bit/s%s"};
    fail(bitRate < range.lowest ? kBelow : kAbove, file.getDisplayName(), bitRate, codec, format.rate,
         format.channels, range.lowest, range.highest,
         isLikelyKilo ? peru::format(" (%dk?)", bitRate) : peru::newString(""));
}

} // namespace sonora2::plugins
