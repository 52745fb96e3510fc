#include "peru/media/PlayClock.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <tuple>

using peru::media::CPlayClock;

TEST(PlayClock, CountsWhatHasBeenHeard) {
    CPlayClock clock(100.0);
    EXPECT_EQ(clock.getHeard(5.0), 0.0);
    clock.add(10.0, 100); // until 11
    clock.add(11.0, 100); // until 12
    clock.add(15.0, 50);  // after a pause, until 15.5
    const struct {
        double now;
        double heard;
    } cases[] = {
        {9.0, 0},    {10.0, 0},   {10.25, 25},  {11.5, 150}, {11.0, 150}, // time does not go backwards
        {13.0, 200}, {14.9, 200}, {15.25, 225}, {15.5, 250}, {1e9, 250}};
    for (const auto& each : cases) EXPECT_NEAR(clock.getHeard(each.now), each.heard, 1e-6) << each.now;
}

// Thousands of blocks, far ahead, with jittering times, queried rarely or often.
TEST(PlayClock, NeverFallsAndReachesTheEnd) {
    for (const auto& [askEvery, frames, ahead] :
         {std::tuple(1, 512, 0.2), {7, 512, 0.2}, {500, 512, 0.2}, {1, 94, 2.0}, {1000, 94, 2.0}}) {
        CPlayClock clock(44100.0);
        double last = 0.0;
        int64_t given = 0;
        uint32_t random = 1;
        for (int i = 0; i < 9000; ++i) {
            random = random * 1664525u + 1013904223u;
            const double now = static_cast<double>(given) / 44100.0;
            clock.add(now + ahead + (random >> 16) * 1e-8, frames);
            given += frames;
            if (i % askEvery != 0) continue;
            const double heard = clock.getHeard(now);
            ASSERT_GE(heard, last);
            ASSERT_LE(heard, static_cast<double>(given));
            ASSERT_NEAR(heard, std::max(0.0, (now - ahead) * 44100.0), 512.0) << i;
            last = heard;
        }
        EXPECT_EQ(clock.getHeard(1e6), static_cast<double>(given));
    }
}
