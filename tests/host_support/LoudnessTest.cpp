#include "HostSupport.h"
#include "host/Wav.h"
#include "peru/threads/ThreadBudget.h"

#include <tuple>
#include <vector>

namespace {

using namespace tests;

class HostLoudness : public CHostTest {
protected:
    static CHandle makeSource(const SSound& sound) {
        return CHandle(TONEWRIGHT_Host_CreateSourceFromMemory(sound.rate, sound.channels, sound.bits / 8,
                                                              sound.samples.data(),
                                                              static_cast<int64_t>(sound.frames())));
    }
};

} // namespace

TEST_F(HostLoudness, GainSourcesChangeEveryWidth) {
    for (const int bits : {8, 16, 24, 32}) {
        const SSound sound = makeNoise(48000, 1, bits, 9000);
        const CHandle source = makeSource(sound);
        for (const int width : {0, 1, 2, 3, 4})
            for (const double gain : {0.0, 0.3, 1.0, 3.0}) {
                SSound changed{48000, 1, width > 0 ? 8 * width : bits, {}};
                changed.samples.resize(9001 * changed.frameBytes());
                const CHandle gained(TONEWRIGHT_Host_CreateGainSource(source, gain, width));
                const CHandle reader(TONEWRIGHT_Host_CreateReader(gained));
                EXPECT_EQ(TONEWRIGHT_Host_Seek(reader, 0.0), 1);
                ASSERT_EQ(TONEWRIGHT_Host_ReadFrames(reader, changed.samples.data(), 9001), 9000);
                const double scale = std::ldexp(1.0, changed.bits - 1);
                for (size_t i = 0; i < sound.frames(); ++i)
                    ASSERT_EQ(changed.at(i, 0) * scale,
                              std::rint(std::clamp(sound.at(i, 0) * gain * scale, -scale, scale - 1)))
                        << bits << " to " << width * 8;
            }
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
        const CHandle source = makeSource(sound);
        std::vector<TONEWRIGHT_Loudness> results;
        for (const int threads : {1, 2, 8}) {
            peru::getThreadBudget().setLimit(threads);
            const CHandle measurement(TONEWRIGHT_Host_MeasureLoudness(source, nullptr, nullptr));
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
    const CHandle source = makeSource(makeTone(48000, 1, 16, 1));
    const auto answer = [](double, void* user) { return *static_cast<int32_t*>(user); };
    int32_t discard = TONEWRIGHT_DISCARD, stop = TONEWRIGHT_STOP;
    EXPECT_FALSE(CHandle(TONEWRIGHT_Host_MeasureLoudness(source, answer, &discard)));
    EXPECT_TRUE(CHandle(TONEWRIGHT_Host_MeasureLoudness(source, answer, &stop)));
    EXPECT_EQ(TONEWRIGHT_AudioSource_IsOpened(source), 0);
    EXPECT_FALSE(TONEWRIGHT_Host_MeasureLoudness(nullptr, nullptr, nullptr));
    const TONEWRIGHT_Handle wrong[] = {source, nullptr};
    EXPECT_EQ(TONEWRIGHT_Host_GetLoudness(wrong, 1, nullptr), 0);
    EXPECT_EQ(TONEWRIGHT_Host_GetLoudness(wrong, 0, nullptr), 0);
    for (const double gain : {-1.0, std::nan(""), double{INFINITY}})
        EXPECT_FALSE(TONEWRIGHT_Host_CreateGainSource(source, gain, 0));
    EXPECT_FALSE(TONEWRIGHT_Host_CreateGainSource(source, 1.0, 5));
    EXPECT_FALSE(TONEWRIGHT_Host_CreateGainSource(nullptr, 1.0, 0));
}
