#include "peru/media/FormatSearch.h"

#include <algorithm>
#include <cstdlib>
#include <vector>

namespace peru::media {

namespace {

void sortByDistance(std::vector<int32_t>& values, int64_t wanted) {
    std::sort(values.begin(), values.end(), [wanted](int32_t a, int32_t b) {
        const int64_t distanceA = std::abs(a - wanted);
        const int64_t distanceB = std::abs(b - wanted);
        return distanceA != distanceB ? distanceA < distanceB : a > b;
    });
    values.erase(std::unique(values.begin(), values.end()), values.end());
}

} // namespace

P<CAudioFormat> findNearestFormat(const P<CAudioFormat>& wanted, int32_t maxChannelCount,
                                  int32_t defaultSampleRate, const FormatTest& isTaken) {
    std::vector<int32_t> rates{8000,  11025, 16000, 22050,  32000,  44100,
                               48000, 88200, 96000, 176400, 192000, defaultSampleRate};
    if (wanted->getSampleRate() > 0) rates.push_back(wanted->getSampleRate());
    sortByDistance(rates, wanted->getSampleRate());

    // Some drivers accept more than a hundred channels, and every attempt opens the device.
    std::vector<int32_t> channelCounts{1, 2, 4, 6, 8, maxChannelCount, wanted->getChannelCount()};
    std::erase_if(channelCounts, [=](int32_t count) { return count < 1 || count > maxChannelCount; });
    sortByDistance(channelCounts, wanted->getChannelCount());

    for (int32_t rate : rates)
        for (int32_t channelCount : channelCounts) {
            P<CAudioFormat> candidate = make<CAudioFormat>(rate, channelCount, wanted->getBitsPerSample());
            if (isTaken(*candidate)) return candidate;
        }
    return nullptr;
}

} // namespace peru::media
