#include "host/Wav.h"
#include "peru/threads/ThreadBudget.h"

#include <gtest/gtest.h>
#include <tonewright/host.h>

#include <memory>
#include <tuple>
#include <vector>

namespace {

using namespace tests;

struct SEnd {
    void operator()(TONEWRIGHT_HandleData* handle) const { TONEWRIGHT_Host_DestroyHandle(handle); }
};
using Handle = std::unique_ptr<TONEWRIGHT_HandleData, SEnd>;

class HostLoudness : public testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK); }
    void TearDown() override { TONEWRIGHT_DeInitAll(); }

    static Handle makeSource(const SSound& sound) {
        return Handle(TONEWRIGHT_Host_CreateSourceFromMemory(sound.rate, sound.channels, sound.bits / 8,
                                                             sound.samples.data(),
                                                             static_cast<int64_t>(sound.frames())));
    }
    static double measure(const Handle& source) {
        const Handle measurement(TONEWRIGHT_Host_MeasureLoudness(source.get(), nullptr, nullptr));
        const TONEWRIGHT_Handle handle = measurement.get();
        TONEWRIGHT_Loudness loudness = {};
        loudness.size = sizeof loudness;
        EXPECT_EQ(TONEWRIGHT_Host_GetLoudness(&handle, 1, &loudness), 1);
        return loudness.integrated;
    }
};

} // namespace

TEST_F(HostLoudness, GainSourcesChangeEveryWidth) {
    for (const int bits : {8, 16, 24, 32}) {
        const SSound sound = makeTone(48000, 1, bits, 1);
        const Handle source = makeSource(sound);
        const double loudness = measure(source);
        for (const int width : {0, 1, 2, 3, 4}) {
            const Handle quiet(TONEWRIGHT_Host_CreateGainSource(source.get(), 0.25, width));
            EXPECT_NEAR(measure(quiet), loudness - 12.04, 0.1) << bits << " to " << width * 8;
        }
        SSound loud = sound;
        const Handle gained(TONEWRIGHT_Host_CreateGainSource(source.get(), 3.0, 0));
        const Handle reader(TONEWRIGHT_Host_CreateReader(gained.get()));
        ASSERT_EQ(TONEWRIGHT_Host_ReadFrames(reader.get(), loud.samples.data(), 48000), 48000);
        for (size_t i = 0; i < loud.frames(); ++i)
            ASSERT_NEAR(loud.at(i, 0), std::clamp(3 * sound.at(i, 0), -1.0, 1.0), std::ldexp(1.01, 1 - bits));
    }
}

// Peaks that only the curve through the samples has, where the sound is divided and elsewhere.
TEST_F(HostLoudness, AnyNumberOfThreadsMeasuresTheSame) {
    const int limit = peru::getThreadBudget().getLimit();
    for (const auto& [rate, channels, bits] : {std::tuple{44100, 2, 16}, {96000, 1, 24}, {48000, 6, 8}}) {
        SSound sound = makeNoise(rate, channels, bits, 1200000 / (channels * bits / 8));
        const size_t part = 524288 / (64 * sound.frameBytes()) * 64 * sound.frameBytes();
        for (size_t at = 0; at < sound.samples.size(); ++at) {
            const size_t distance = std::min(at % part, part - at % part);
            if (distance > 20 * sound.frameBytes()) sound.samples[at] = bits == 8 ? '\x7e' : '\0';
        }
        const Handle source = makeSource(sound);
        std::vector<TONEWRIGHT_Loudness> results;
        for (const int threads : {1, 2, 8}) {
            peru::getThreadBudget().setLimit(threads);
            const Handle measurement(TONEWRIGHT_Host_MeasureLoudness(source.get(), nullptr, nullptr));
            const TONEWRIGHT_Handle handle = measurement.get();
            results.emplace_back().size = sizeof(TONEWRIGHT_Loudness);
            EXPECT_EQ(TONEWRIGHT_Host_GetLoudness(&handle, 1, &results.back()), 1);
        }
        peru::getThreadBudget().setLimit(limit);
        EXPECT_GT(results[0].truePeak, results[0].samplePeak);
        for (const TONEWRIGHT_Loudness& loudness : results)
            EXPECT_EQ(std::memcmp(&results[0], &loudness, sizeof loudness), 0) << describe(sound);
    }
}

TEST_F(HostLoudness, AnswersAndBadArguments) {
    const Handle source = makeSource(makeTone(48000, 1, 16, 1));
    const auto answer = [](double, void* user) { return *static_cast<int32_t*>(user); };
    int32_t discard = TONEWRIGHT_DISCARD, stop = TONEWRIGHT_STOP;
    EXPECT_FALSE(Handle(TONEWRIGHT_Host_MeasureLoudness(source.get(), answer, &discard)));
    EXPECT_TRUE(Handle(TONEWRIGHT_Host_MeasureLoudness(source.get(), answer, &stop)));
    EXPECT_EQ(TONEWRIGHT_AudioSource_IsOpened(source.get()), 0);
    EXPECT_FALSE(TONEWRIGHT_Host_MeasureLoudness(nullptr, nullptr, nullptr));
    const TONEWRIGHT_Handle wrong[] = {source.get(), nullptr};
    EXPECT_EQ(TONEWRIGHT_Host_GetLoudness(wrong, 1, nullptr), 0);
    EXPECT_EQ(TONEWRIGHT_Host_GetLoudness(wrong, 0, nullptr), 0);
    for (const double gain : {-1.0, std::nan(""), double{INFINITY}})
        EXPECT_FALSE(TONEWRIGHT_Host_CreateGainSource(source.get(), gain, 0));
    EXPECT_FALSE(TONEWRIGHT_Host_CreateGainSource(source.get(), 1.0, 5));
    EXPECT_FALSE(TONEWRIGHT_Host_CreateGainSource(nullptr, 1.0, 0));
}
