#include "sonora2/tracks/MixSamples.h"

#include "sonora2/tracks/TrackSupport.h"

#include <gtest/gtest.h>

#include <random>

namespace {

using namespace tests;

TEST(Mix, Samples_FollowTheRuleForEveryValue) {
    Samples all(65536);
    for (int i = 0; i < 65536; ++i) all[static_cast<size_t>(i)] = static_cast<int16_t>(i);
    std::vector<int> others = {0, 1, -1, 2, -2, 181, -181, 32767, 32766, -32768, -32767, 16384, -16384};
    std::mt19937 random(7);
    for (int i = 0; i < 300; ++i) others.push_back(static_cast<int16_t>(random()));
    for (int b : others) {
        // An odd start and length, to cover the samples that do not fill a vector.
        for (size_t first : {size_t{0}, size_t{3}}) {
            Samples sum(all.size(), static_cast<int16_t>(b));
            const size_t count = all.size() - first * 2;
            sonora2::audio::mixSamples(all.data() + first, sum.data() + first, count);
            for (size_t i = 0; i < sum.size(); ++i) {
                const bool mixed = i >= first && i < first + count;
                ASSERT_EQ(sum[i], mixed ? mixPlain(all[i], b) : b) << all[i] << " into " << b;
            }
        }
    }
}

struct SMixCase {
    const char* name;
    std::vector<STrackPlan> tracks;
    int channels = 1;
};

std::vector<STrackPlan> makeTracks(int count, int channels, double gap) {
    std::vector<STrackPlan> plans;
    for (int i = 0; i < count; ++i) {
        const double start = gap * i;
        SNoise noise = {i + 1, 4000 + 100 * i, 8000, channels, {300 + i * 7, 1, 1111}};
        plans.push_back({noise, i, start, start + static_cast<double>(noise.frames) / 8000});
    }
    return plans;
}

std::vector<STrackPlan> withChange(sonora2::audio::SVolumeChange change, std::vector<int> cuts) {
    SNoise noise;
    noise.cuts = std::move(cuts);
    return {{noise, 0, 0.0, 1.0, true, 0.0, {change}}};
}

std::vector<SMixCase> makeMixCases() {
    const SNoise noise;
    SNoise other = noise, slow = noise;
    other.seed = 2;
    return {
        {"one", makeTracks(1, 1, 0.0)},
        {"two", makeTracks(2, 2, 0.1), 2},
        {"three", makeTracks(3, 1, 0.2)},
        {"eight", makeTracks(8, 2, 0.05), 2},
        {"forty", makeTracks(40, 1, 0.03)},
        {"gaps", {{noise, 0, 0.5, 1.0}, {other, 0, 3.0, 3.25}, {noise, 0, 7.0, 7.001}}},
        {"overlap on a lane", {{noise, 0, 0.0, 0.8}, {other, 0, 0.2, 1.6}, {noise, 0, 0.3, 0.7}}},
        {"overlap on two", {{noise, 0, 0.0, 0.8}, {other, 1, 0.2, 1.6}}},
        {"lanes out of order", {{noise, 5, 0.0, 0.8}, {other, -1, 0.0, 1.0}, {noise, 2, 0.1, 0.9}}},
        {"starts out of order", {{noise, 0, 1.0, 1.5}, {other, 0, 0.0, 0.5}}},
        {"disabled", {{noise, 0, 0.0, 1.0, false}, {other, 1, 0.0, 1.0}, {noise, 1, 1.2, 1.4, false}}},
        {"medium ends early", {{noise, 0, 0.0, 2.0}, {other, 1, 0.0, 1.5}}},
        {"no length", {{noise, 0, 0.0, 0.0}}},
        {"end before start", {{noise, 0, 1.0, 0.5}, {other, 1, 0.0, 0.7}}},
        {"fade fits its chunk", withChange({0.0, 1.0, 0.25, 0.5}, {2000})},
        {"fade straddles", withChange({0.0, 1.0, 0.2, 0.6}, {2000})},
        {"fade lies inside", withChange({1.0, 0.0, 0.3, 0.4}, {2000})},
        {"fade beyond the end", withChange({0.0, 1.0, 0.0, 2.0}, {500, 37})},
        {"clipping", withChange({1.0, 9.5, 0.0, 1.0}, {800})},
        {"constant", withChange({0.5, 0.5005, 0.0, 1.0}, {800, 3})},
        {"negative gain", withChange({-1.0, -2.0, 0.0, 1.0}, {800})},
        {"half speed", {{noise, 0, 0.0, 2.0, true, 0.5}, {other, 1, 0.0, 1.0}}},
        {"double speed", {{noise, 0, 0.0, 0.5, true, 2.0}, {other, 1, 0.0, 1.0}}},
    };
}

TEST(Mix, List_EqualsThePlainRule) {
    for (const SMixCase& c : makeMixCases()) {
        for (bool openInThread : {false, true}) {
            SCOPED_TRACE(std::string(c.name) + (openInThread ? ", opened in a thread" : ""));
            const P<sonora2::common::ISonoraContext> context =
                peru::make<sonora2::audio::CSonoraContextAudio>();
            auto list = peru::make<sonora2::audio::CAudioTracklist>(openInThread, context, 8000, c.channels,
                                                                    2, 400, 0.0, 0);
            for (const STrackPlan& plan : c.tracks)
                list->addTrack(makeTrack(context, plan), plan.start, plan.end);
            Samples expected = renderList(c.tracks, 8000, c.channels, 400);
            for (int run = 0; run < 2; ++run) { // the second from the start again
                list->open();
                Samples played;
                int64_t position = 0;
                while (const P<sonora2::audio::IAudioChunk> chunk = list->getNextAudioChunk()) {
                    ASSERT_EQ(chunk->getTimestamp(), static_cast<double>(position) / 8000);
                    append(played, chunk);
                    position = static_cast<int64_t>(played.size()) / c.channels;
                }
                ASSERT_EQ(played.size(), expected.size());
                const auto difference = std::mismatch(played.begin(), played.end(), expected.begin());
                EXPECT_EQ(difference.first - played.begin(), std::ssize(played)) << "first difference";
                list->close();
                EXPECT_EQ(CNoiseSource::s_open, 0);
            }
        }
    }
}

} // namespace
