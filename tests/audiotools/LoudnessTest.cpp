#include "host/Wav.h"

#include <gtest/gtest.h>
#include <tonewright/audiotools.h>

#include <functional>
#include <memory>

namespace {

using namespace tests;

struct SEnd {
    void operator()(TONEWRIGHT_Analysator* analysator) const { analysator->operations->destroy(analysator); }
};
using Analysator = std::unique_ptr<TONEWRIGHT_Analysator, SEnd>;

// Adds the sound in pieces that end within frames.
Analysator measure(const SSound& sound, int flags = TONEWRIGHT_ANALYSATOR_PEAKS) {
    Analysator analysator(createLoudnessAnalysator(flags));
    const auto* operations = analysator->operations;
    operations->initialise(analysator.get(), sound.channels, sound.bits / 8, sound.rate);
    for (size_t at = 0, piece = 1; at < sound.samples.size(); at += piece, piece = piece * 5 % 40009 + 1) {
        const size_t size = std::min(piece, sound.samples.size() - at);
        operations->analyse(analysator.get(), sound.samples.data() + at, static_cast<int64_t>(size));
    }
    return analysator;
}

double resultOf(const Analysator& analysator) {
    return analysator->operations->result(analysator.get());
}

double truePeakOf(const Analysator& analysator) {
    double peak = 0.0;
    EXPECT_EQ(getAnalysatorPeaks(analysator.get(), nullptr, &peak), 1);
    return 20 * std::log10(peak);
}

SSound make(int rate, int channels, int bits, double seconds,
            const std::function<double(double time, int channel)>& curve) {
    SSound sound{rate, channels, bits, {}};
    const size_t width = static_cast<size_t>(bits / 8);
    for (int frame = 0; frame < seconds * rate; ++frame)
        for (int channel = 0; channel < channels; ++channel) {
            const double level = std::clamp(curve(static_cast<double>(frame) / rate, channel), -1.0, 1.0);
            auto value = static_cast<uint32_t>(static_cast<int32_t>(std::lround(level * 2147483583.0)));
            if (bits == 8) value ^= 0x80000000;
            sound.samples.append(reinterpret_cast<const char*>(&value) + 4 - width, width);
        }
    return sound;
}

double decibels(double level) {
    return std::pow(10.0, level / 20);
}

double tone(double frequency, double time, double phase = 0) {
    return std::sin(2 * M_PI * frequency * time + phase * M_PI / 180);
}

struct SPart {
    double seconds;
    std::vector<double> levels; // dBFS of each channel
};

SPart stereo(double seconds, double level) {
    return {seconds, {level, level}};
}

// Tones of 1 kHz, one after the other.
SSound makeTones(const std::vector<SPart>& parts) {
    SSound sound{48000, static_cast<int>(parts[0].levels.size()), 24, {}};
    for (const SPart& part : parts) {
        const std::string period = make(48000, sound.channels, 24, 0.001, [&](double t, int c) {
                                       return decibels(part.levels[static_cast<size_t>(c)]) * tone(1000, t);
                                   }).samples;
        for (int i = 0; i < part.seconds * 1000; ++i) sound.samples += period;
    }
    return sound;
}

} // namespace

// The test signals of EBU Tech 3341 and 3342 that consist of tones, with their tolerances.
TEST(Loudness, MeetsTheMinimumRequirements) {
    const std::vector<SPart> cases[] = {
        {stereo(20, -23)},
        {stereo(10, -36), stereo(60, -23), stereo(10, -36)},
        {stereo(10, -72), stereo(10, -36), stereo(60, -23), stereo(10, -36), stereo(10, -72)},
        {stereo(20, -26), stereo(20.1, -20), stereo(20, -26)},
        {{20, {-28, -28, -24, -30, -30}}},
    };
    for (const std::vector<SPart>& parts : cases)
        EXPECT_NEAR(resultOf(measure(makeTones(parts), 0)), -23.0, 0.1);
    const std::pair<std::vector<double>, double> ranges[] = {
        {{-20, -30}, 10}, {{-20, -15}, 5}, {{-40, -20}, 20}, {{-50, -35, -20, -35, -50}, 15}};
    for (const auto& [levels, range] : ranges) {
        std::vector<SPart> parts;
        for (const double level : levels) parts.push_back(stereo(20, level));
        const Analysator analysator = measure(makeTones(parts), TONEWRIGHT_ANALYSATOR_RANGE);
        TONEWRIGHT_Analysator* const one = analysator.get();
        EXPECT_NEAR(getAnalysatorRange(&one, 1), range, 1.0);
    }
    EXPECT_NEAR(
        resultOf(measure(make(48000, 2, 24, 3, [](double t, int) { return decibels(-33) * tone(1000, t); }))),
        -33.0, 0.1);

    const std::vector<std::pair<double, double>> peaks = {{4, 0}, {4, 45}, {6, 60}, {8, 67.5}};
    for (const auto& [divisor, phase] : peaks) {
        const double peak = truePeakOf(measure(make(48000, 2, 24, 0.5, [&](double t, int) {
            return 0.5 * std::min({1.0, t * 20, (0.5 - t) * 20}) * tone(48000 / divisor, t, phase);
        })));
        EXPECT_GE(peak, -6.4) << divisor;
        EXPECT_LE(peak, -5.8) << divisor;
    }
}

// Channels at the sides count more; those behind the listener do not, and low frequencies not at all.
TEST(Loudness, EachChannelHasTheWeightOfItsPlace) {
    const std::vector<double> layouts[] = {{0, 0, 0, -INFINITY, 1.5, 1.5},
                                           {0, 0, 0, -INFINITY, 0, 1.5, 1.5},
                                           {0, 0, 0, -INFINITY, 0, 0, 1.5, 1.5},
                                           std::vector<double>(9)};
    for (const std::vector<double>& gains : layouts)
        for (size_t only = 0; only < gains.size(); ++only) {
            const auto sound = make(8000, static_cast<int>(gains.size()), 16, 0.5, [=](double t, int c) {
                return static_cast<size_t>(c) == only ? decibels(-20) * tone(1000, t) : 0.0;
            });
            const double loudness = resultOf(measure(sound, 0)), expected = gains[only] - 23.0;
            EXPECT_TRUE(loudness == expected || std::fabs(loudness - expected) < 0.1)
                << loudness << " for channel " << only << " of " << gains.size();
        }
}

TEST(Loudness, AlbumsFloatsAndSoundThatCannotBeMeasured) {
    const auto at = [](double level) {
        return make(48000, 2, 32, 2, [=](double t, int) { return decibels(level) * tone(1000, t); });
    };
    const Analysator loud = measure(at(-20)), quiet = measure(at(-26));
    TONEWRIGHT_Analysator* const album[] = {loud.get(), quiet.get()};
    const double together = getAnalysatorLoudness(album, 2), peak = truePeakOf(loud);
    EXPECT_NEAR(together, 10 * std::log10((1 + decibels(-12)) / 2) - 20, 0.1);
    EXPECT_TRUE(std::isnan(getAnalysatorLoudness(nullptr, 1)) && std::isnan(getAnalysatorLoudness(album, 0)));
    EXPECT_TRUE(std::isnan(getAnalysatorRange(nullptr, 1)) && std::isnan(getAnalysatorRange(album, 0)));
    // The peaks of what follows, from bytes at any address.
    for (const int bits : {8, 16, 24, 32}) {
        const SSound high = make(48000, 2, bits, 0.2, [](double t, int) { return 0.5 * tone(1000, t); });
        const SSound low = make(48000, 2, bits, 0.2, [](double t, int) { return 0.25 * tone(1000, t); });
        const Analysator both = measure(high);
        EXPECT_EQ(forgetAnalysatorPeaks(both.get()), 1);
        const std::string shifted = "x" + low.samples;
        both->operations->analyse(both.get(), shifted.data() + 1, static_cast<int64_t>(low.samples.size()));
        for (const bool isFinished : {false, true}) {
            double sample = 0, truth = 0;
            if (isFinished) finishAnalysator(both.get());
            EXPECT_EQ(getAnalysatorPeaks(both.get(), &sample, &truth), 1);
            EXPECT_NEAR(sample, 0.25, 0.01) << bits;
            EXPECT_NEAR(truth, 0.3, 0.1) << bits;
        }
        EXPECT_EQ(forgetAnalysatorPeaks(both.get()), 0);
    }
    EXPECT_EQ(forgetAnalysatorPeaks(nullptr) + forgetAnalysatorPeaks(measure(at(-20), 0).get()), 0);
    finishAnalysator(loud.get());
    loud->operations->analyse(loud.get(), at(0).samples.data(), 96000);
    EXPECT_EQ(getAnalysatorLoudness(album, 2), together);
    EXPECT_EQ(truePeakOf(loud), peak);
    EXPECT_TRUE(std::isnan(getAnalysatorRange(album, 2)));

    SSound floats{48000, 2, 32, {}}, doubles{48000, 2, 64, {}};
    for (int i = 0; i < 96000; ++i) {
        const double samples[] = {2 * tone(1000, i / 48000.0), i == 9 ? NAN : 0.0};
        const float narrow[] = {static_cast<float>(samples[0]), static_cast<float>(samples[1])};
        floats.samples.append(reinterpret_cast<const char*>(narrow), sizeof narrow);
        doubles.samples.append(reinterpret_cast<const char*>(samples), sizeof samples);
    }
    for (const SSound& sound : {floats, doubles}) {
        const Analysator loudest = measure(sound, TONEWRIGHT_ANALYSATOR_PEAKS | TONEWRIGHT_ANALYSATOR_FLOAT);
        EXPECT_NEAR(resultOf(loudest), 3.0, 0.1);
        EXPECT_NEAR(truePeakOf(loudest), 6.02, 0.1);
    }

    EXPECT_EQ(resultOf(measure(make(44100, 2, 16, 1, [](double, int) { return 0.0; }))), -INFINITY);
    EXPECT_EQ(resultOf(measure({})), -INFINITY);
    const int formats[][3] = {{0, 2, 44100}, {-1, 2, 44100}, {2, 5, 44100},    {2, 0, 44100},
                              {2, 2, 0},     {70, 2, 44100}, {2, 2, INT32_MAX}};
    for (const auto& [channels, bytes, rate] : formats) {
        const Analysator analysator(createNormalizeAnalysator());
        analysator->operations->initialise(analysator.get(), channels, bytes, rate);
        analysator->operations->analyse(analysator.get(), "12345678", 8);
        EXPECT_TRUE(std::isnan(resultOf(analysator))) << channels << " " << bytes << " " << rate;
        EXPECT_EQ(getAnalysatorPeaks(analysator.get(), nullptr, nullptr), 0);
    }

    EXPECT_DOUBLE_EQ(convertDeltaDBValue(0), 32767.0);
    EXPECT_NEAR(convertDeltaDBValue(-6.0206), 16383.5, 0.1);
    for (const double endless : {double{INFINITY}, -double{INFINITY}, std::nan(""), 1e9})
        EXPECT_EQ(convertDeltaDBValue(endless), 32767.0);
}
