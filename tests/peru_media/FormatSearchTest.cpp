#include "peru/media/FormatSearch.h"

#include <gtest/gtest.h>

using namespace peru;
using namespace peru::media;

TEST(FormatSearch, FindsTheNearest) {
    struct SCase {
        int32_t rate;
        int32_t channels;
        FormatTest isTaken;
        int32_t foundRate;
        int32_t foundChannels;
    };
    const auto any = [](const CAudioFormat&) { return true; };
    const auto onlyRate = [](int32_t rate) {
        return [rate](const CAudioFormat& format) { return format.getSampleRate() == rate; };
    };
    const SCase cases[] = {
        {44100, 2, any, 44100, 2},
        {37000, 3, any, 37000, 3}, // not a common rate, but accepted
        {44100, 2, onlyRate(48000), 48000, 2},
        {37000, 2, onlyRate(44123), 44123, 2}, // the device's default
        {38050, 1,
         [](const CAudioFormat& f) { return f.getSampleRate() % 100 == 0 && f.getSampleRate() != 38050; },
         44100, 1}, // as near as 32000
        {44100, 3, [](const CAudioFormat& f) { return f.getChannelCount() % 2 == 0; }, 44100, 4},
        {44100, 100, any, 44100, 6}, // more than the maximum
        {0, 0, any, 8000, 1},
        {-5, -5, any, 8000, 1},
        // The rate takes precedence over the channels.
        {44100, 1,
         [](const CAudioFormat& f) { return f.getSampleRate() == 48000 || f.getChannelCount() == 6; }, 44100,
         6},
    };
    for (const SCase& each : cases) {
        const P<CAudioFormat> found =
            findNearestFormat(make<CAudioFormat>(each.rate, each.channels, 24), 6, 44123, each.isTaken);
        ASSERT_TRUE(found);
        EXPECT_EQ(found->getSampleRate(), each.foundRate) << each.rate << " " << each.channels;
        EXPECT_EQ(found->getChannelCount(), each.foundChannels) << each.rate << " " << each.channels;
        EXPECT_EQ(found->getBitsPerSample(), 24);
    }
    const auto none = [](const CAudioFormat&) { return false; };
    EXPECT_FALSE(findNearestFormat(make<CAudioFormat>(44100, 2, 16), 2, 44100, none));
    EXPECT_FALSE(findNearestFormat(make<CAudioFormat>(44100, 2, 16), 0, 44100, any));
}
