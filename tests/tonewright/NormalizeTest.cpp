// What the library does with the audio tools.
#include "Library.h"
#include "peru/Errors.h"
#include "sonora2/tracks/IAudioEqualizer.h"
#include "support/Environment.h"

#include <cmath>
#include <numeric>

namespace {

using namespace tests;

// Two seconds of a tone of 1 kHz in both channels: -40 LUFS and then -20.
class CTone : public CFakeSource {
public:
    explicit CTone(SFakeSource script = {}) : CFakeSource(complete(std::move(script))) {}

    P<sonora2::audio::IAudioChunk> getNextAudioChunk() override {
        const P<sonora2::audio::IAudioChunk> chunk = CFakeSource::getNextAudioChunk();
        const int64_t channels = getChannelCount(), samples = chunk->getSize() / 2;
        const double peak = 32768 * (chunk->getTimestamp() < 1.0 ? 0.01 : 0.1);
        for (int64_t i = 0; i < samples; ++i)
            reinterpret_cast<int16_t*>(chunk->getData())[i] =
                static_cast<int16_t>(std::lround(peak * std::sin(2 * M_PI * (i / channels) / 48)));
        return chunk;
    }

private:
    static SFakeSource complete(SFakeSource script) {
        script.rate = 48000;
        script.frames = 96000;
        script.chunkFrames = 4800;
        return script;
    }
};

class Normalize : public CLibraryTest {
protected:
    static double measure(const P<CTone>& tone, TONEWRIGHT_NormalizeCallback callback = nullptr) {
        return TONEWRIGHT_INORMALIZE_processAudioSource(wrap(tone).get(), -14.0, callback);
    }
    static bool isLoaded() { return readFile("/proc/self/maps").find("/audiotools.so") != std::string::npos; }
};

TEST_F(Normalize, MeasuresWhatIsReadOfASource) {
    EXPECT_FALSE(isLoaded()) << "by the start of the library";
    const auto tone = peru::make<CTone>();
    // The quiet half is gated, except for the blocks that reach into the other one.
    EXPECT_NEAR(20 * std::log10(measure(tone)), 6.0, 0.8);
    EXPECT_TRUE(isLoaded());
    EXPECT_TRUE(tone->isOpened());
    EXPECT_EQ(measure(tone), 1.0) << "at its end";
    for (double skipped : {0.0, 1.5}) {
        tone->skipToTime(skipped);
        EXPECT_EQ(measure(tone, [](double) { return false; }), 1.0);
    }
    tone->skipToTime(0.0);
    EXPECT_NEAR(20 * std::log10(measure(tone, [](double fraction) { return fraction < 0.5; })), 26.0, 0.1);

    static std::vector<double> s_fractions;
    tone->skipToTime(0.0);
    measure(tone, [](double fraction) {
        s_fractions.push_back(fraction);
        return true;
    });
    ASSERT_EQ(s_fractions.size(), 20u);
    EXPECT_EQ(tone->opens, 1);
    EXPECT_DOUBLE_EQ(std::accumulate(s_fractions.begin(), s_fractions.end(), 0.0), 9.5);
}

TEST_F(Normalize, FailuresHaveTheirValues) {
    EXPECT_EQ(TONEWRIGHT_INORMALIZE_processAudioSource(nullptr, -18.0, nullptr), 3.0);
    EXPECT_EQ(TONEWRIGHT_INORMALIZE_processAudioSource(log->getHandle(), -18.0, nullptr), 3.0);
    const auto fail = [] { throw peru::CError("This source fails"); };
    for (const bool opens : {false, true}) {
        SFakeSource script;
        (opens ? script.onRead : script.onOpen) = fail;
        EXPECT_EQ(measure(peru::make<CTone>(script)), 0.0);
        EXPECT_EQ(log->take().back().text, "This source fails");
    }
    EXPECT_EQ(measure(peru::make<CTone>(SFakeSource{.channels = 65})), 0.0);
    EXPECT_EQ(log->take().back().text,
              "The loudness of 65 channels with 2 bytes per sample at 48000 Hz cannot be measured");
}

TEST_F(Normalize, LibrariesThatCannotBeUsedFail) {
    const CTempFolder broken, other;
    broken.write("audiotools.so", "no library");
    std::filesystem::create_symlink(TEST_PLUGIN, other / "audiotools.so");
    for (const CTempFolder* folder : {&broken, &other}) {
        const CEnvironment environment("TONEWRIGHT_PLUGIN_PATH", folder->path());
        EXPECT_EQ(measure(peru::make<CTone>()), 0.0);
        EXPECT_NE(
            log->take().back().text.find(folder == &broken ? "audiotools.so" : "createNormalizeAnalysator"),
            std::string::npos);
    }
    EXPECT_GT(measure(peru::make<CTone>()), 0.0) << "tries again";
    TONEWRIGHT_DeInitAll();
    EXPECT_FALSE(isLoaded());
    EXPECT_EQ(measure(peru::make<CTone>()), 0.0) << "not started";
    ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK);
}

TEST_F(Normalize, EqualizersComeFromTheSameLibrary) {
    P<sonora2::audio::IAudioEqualizer> equalizer =
        sonora2::audio::createAudioToolsHandler()->createEqualizer();
    equalizer->configure(44100, 2, 1);
    std::vector<int16_t> samples(100, 1000), unchanged = samples;
    const auto process = [&](int preset) {
        equalizer->select(preset);
        equalizer->process(reinterpret_cast<uint8_t*>(samples.data()), 200);
    };
    process(0);
    EXPECT_EQ(samples, unchanged);
    process(1);
    EXPECT_NE(samples, unchanged);
    equalizer.reset();
    TONEWRIGHT_DeInitAll();
    EXPECT_FALSE(sonora2::audio::createAudioToolsHandler());
    ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK);
}

} // namespace
