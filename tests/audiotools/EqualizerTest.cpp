#include "host/Wav.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>
#include <tonewright/audiotools.h>

#include <array>
#include <memory>
#include <set>

namespace {

using namespace tests;

struct SEnd {
    void operator()(TONEWRIGHT_Equalizer* equalizer) const { equalizer->operations->destroy(equalizer); }
};

// Processes the sound in pieces of whole frames.
SSound equalize(SSound sound, int preset) {
    const std::unique_ptr<TONEWRIGHT_Equalizer, SEnd> equalizer(createEqualizer());
    const auto* operations = equalizer->operations;
    operations->configure(equalizer.get(), sound.rate, sound.bits / 8, sound.channels);
    operations->select(equalizer.get(), preset);
    const size_t piece = 777 * sound.frameBytes();
    for (size_t at = 0; at < sound.samples.size(); at += piece)
        operations->process(equalizer.get(), sound.samples.data() + at,
                            static_cast<int64_t>(std::min(piece, sound.samples.size() - at)));
    return sound;
}

// The same noise, to the precision of the width, at 1 / 2^shift of full scale.
SSound noiseOf(int bits, int shift) {
    const SSound full = makeNoise(44100, 2, 32, 20000);
    SSound sound{44100, 2, bits, {}};
    const size_t width = static_cast<size_t>(bits / 8);
    for (size_t at = 0; at < full.samples.size(); at += 4) {
        int32_t value = 0;
        std::memcpy(&value, full.samples.data() + at, 4);
        value = (value & ~0xFFFFFF) >> shift;
        if (bits == 8) value ^= INT32_MIN;
        sound.samples.append(reinterpret_cast<const char*>(&value) + 4 - width, width);
    }
    return sound;
}

double greatestDifference(const SSound& a, const SSound& b, double factor = 1.0) {
    EXPECT_EQ(a.frames(), b.frames());
    double difference = 0;
    for (size_t i = 0; i < std::min(a.frames(), b.frames()); ++i)
        for (int channel = 0; channel < a.channels; ++channel)
            difference = std::max(
                difference, std::fabs(a.at(i, channel) - std::clamp(b.at(i, channel) * factor, -1.0, 1.0)));
    return difference;
}

} // namespace

TEST(Equalizer, PresetsAgreeWithAnotherProgram) {
    const CTempFolder folder;
    const SSound sound = noiseOf(16, 3);
    folder.write("in.wav", toWav(sound));
    std::set<std::string> names;
    std::array<double, TONEWRIGHT_EQUALIZER_BANDS> gains;
    int preset = 1;
    for (; const char* name = getEqualizerPreset(preset, gains.data()); ++preset) {
        SCOPED_TRACE(name);
        EXPECT_TRUE(names.insert(name).second);
        std::vector<std::string> command{"sox", "-D", "in.wav", "out.wav"};
        for (int band = 0; band < TONEWRIGHT_EQUALIZER_BANDS; ++band)
            command.insert(command.end(), {"equalizer", std::to_string(31.25 * (1 << band)), "1.41q",
                                           std::to_string(gains[static_cast<size_t>(band)])});
        ASSERT_EQ(run(command, folder.path()).exitCode, 0);
        EXPECT_LE(greatestDifference(equalize(sound, preset), parseWav(readFile(folder / "out.wav"))),
                  1.001 / 32768);
    }
    EXPECT_GT(preset, 10);
    for (const int unknown : {0, -1, preset, INT32_MAX, INT32_MIN}) {
        EXPECT_FALSE(getEqualizerPreset(unknown, nullptr));
        EXPECT_TRUE(equalize(sound, unknown) == sound);
    }
}

TEST(Equalizer, WidthsSaturateInsteadOfWrapping) {
    const SSound reference = equalize(noiseOf(32, 3), 12);
    for (const int bits : {8, 16, 24, 32})
        EXPECT_LE(greatestDifference(equalize(noiseOf(bits, 0), 12), reference, 8.0),
                  std::ldexp(1.01, 1 - bits) + std::ldexp(5.0, -31))
            << bits;
}

TEST(Equalizer, ChannelsAreIndependent) {
    const SSound sound = makeNoise(44100, 3, 16, 3000);
    for (const int preset : {1, 2, 12}) {
        const SSound all = equalize(sound, preset);
        for (size_t channel = 0; channel < 3; ++channel) {
            SSound one{44100, 1, 16, {}}, expected = one;
            for (size_t at = 2 * channel; at < sound.samples.size(); at += 6) {
                one.samples += sound.samples.substr(at, 2);
                expected.samples += all.samples.substr(at, 2);
            }
            EXPECT_TRUE(equalize(one, preset) == expected) << preset << " " << channel;
        }
    }
}

TEST(Equalizer, FormatsThatDoNotExistAreLeftAlone) {
    SSound low = makeNoise(8000, 1, 16, 4000);
    EXPECT_FALSE(equalize(low, 14) == low) << "the bands below half the rate have an effect";
    low.rate = 60; // below twice the lowest centre
    EXPECT_TRUE(equalize(low, 1) == low);
    const std::unique_ptr<TONEWRIGHT_Equalizer, SEnd> equalizer(createEqualizer());
    const int formats[][3] = {{0, 2, 2},     {-1, 2, 2},    {44100, 0, 2},
                              {44100, 5, 2}, {44100, 2, 0}, {44100, 2, INT32_MAX}};
    for (const auto& [rate, bytes, channels] : formats) {
        equalizer->operations->configure(equalizer.get(), rate, bytes, channels);
        equalizer->operations->select(equalizer.get(), 1);
        char samples[] = "untouched samples";
        equalizer->operations->process(equalizer.get(), samples, sizeof samples);
        EXPECT_STREQ(samples, "untouched samples");
    }
}
