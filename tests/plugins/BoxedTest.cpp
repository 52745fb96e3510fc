// Plug-ins in slave processes behave like those in this process.
#include "plugins/PluginFixture.h"

#include "sonora2/context/LastFailure.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/IDiscardable.h"
#include "sonora2/media/IFormatSettings.h"
#include "sonora2/media/ISalvage.h"
#include "support/Children.h"

namespace tests {

namespace {

using namespace sonora2::common;

class Boxed : public CFormatTest {
protected:
    Boxed() : boxed(peru::make<CPluginHandler>(context, true)) {
        handler = peru::make<CPluginHandler>(context, false);
        log->lines.clear();
    }

    P<IAudioSource> open(const P<CPluginHandler>& from, const std::filesystem::path& path,
                         const SShape& shape = {}) {
        return from->createAudioSource(toURI(path), shape.rate, shape.channels, shape.bytes, true);
    }
    // Everything that reading shows: samples, then the error if there is one, then the log.
    std::string observe(const P<CPluginHandler>& from, const std::filesystem::path& path) {
        log->lines.clear();
        std::string seen;
        clearLastFailure();
        if (const P<IAudioSource> source = open(from, path)) {
            try {
                seen = readAll(source);
            } catch (const CSonoraError& error) {
                seen += "\nerror: " + text(error.getDescription());
            }
            seen += "\nwarnings: " + text(peru::interfaceCast<IMediaDescription>(source)->takeWarnings());
            source->close();
        } else {
            seen = "refused: " + getLastFailure().message;
        }
        for (const std::string& line : log->lines) seen += "\nlog: " + line;
        return seen;
    }
    void encode(const P<CPluginHandler>& by, const std::string& name, const std::string& pcm) {
        const P<IAudioFormat> format = by->createAudioFormat(toURI(named(name)), 44100, 2, 2);
        format->setAudioQuality(0.25);
        writeAll(format, pcm);
    }

    P<CPluginHandler> boxed;
};

TEST_P(Boxed, Files_AreWrittenAndReadAsInThisProcess) {
    const std::string pcm = makeMusic({}, 30011);
    encode(handler, "plain", pcm);
    encode(boxed, "boxed", pcm);
    EXPECT_EQ(std::filesystem::file_size(named("plain")), std::filesystem::file_size(named("boxed")));
    if (GetParam().lossless) {
        EXPECT_TRUE(readFile(named("plain")) == readFile(named("boxed")));
    }
    EXPECT_TRUE(observe(handler, named("plain")) == observe(boxed, named("plain")));

    // Whatever can be read of a damaged file, its error and its warnings.
    const std::string whole = readFile(named("plain"));
    std::mt19937 random(7);
    for (int i = 0; i < 6; ++i) {
        std::string damaged = whole.substr(0, i < 3 ? random() % whole.size() : whole.size());
        if (i >= 3) damaged[random() % damaged.size()] ^= 0x55;
        folder.write(named("bad").filename(), damaged);
        const std::string expected = observe(handler, named("bad")), seen = observe(boxed, named("bad"));
        EXPECT_TRUE(expected == seen) << "damage " << i << "\n"
                                      << expected.substr(0, 300) << "\n--\n"
                                      << seen.substr(0, 300);
    }
    EXPECT_EQ(observe(handler, named("nowhere")), observe(boxed, named("nowhere")));
}

TEST_P(Boxed, Skips_DeliverTheSameSamples) {
    encode(handler, "plain", makeMusic({}, 100'000));
    const SShape other{48000, 1, 3};
    for (const SShape& shape : {SShape{}, other}) {
        const P<IAudioSource> expected = open(handler, named("plain"), shape),
                              source = open(boxed, named("plain"), shape);
        ASSERT_TRUE(source);
        EXPECT_EQ(expected->getDuration(), source->getDuration());
        std::mt19937 random(3);
        for (int i = 0; i < 50; ++i) {
            const double time = static_cast<double>(random() % 2'400'000) / 1e6;
            if (random() % 10 == 0) {
                expected->setStartTime(time);
                source->setStartTime(time);
            }
            expected->skipToTime(time);
            source->skipToTime(time);
            const size_t limit = random() % 60'000;
            ASSERT_TRUE(readAll(expected, limit) == readAll(source, limit)) << "skip " << i << " to " << time;
            ASSERT_EQ(expected->isEOF(), source->isEOF());
        }
    }
}

TEST_P(Boxed, OptionalInterfaces_AreThoseOfThePlainObject) {
    encode(handler, "plain", makeMusic({}, 5000));
    const P<IAudioSource> expected = open(handler, named("plain")), source = open(boxed, named("plain"));
    const auto media = peru::interfaceCast<IMediaDescription>(source);
    ASSERT_TRUE(media);
    EXPECT_EQ(codecOf(expected), codecOf(source));
    EXPECT_EQ(peru::interfaceCast<IMediaDescription>(expected)->getBitRate(), media->getBitRate());
    media->setDeliveredFormat(22050, 1, 2);
    EXPECT_EQ(22050, source->getSampleRate());
    const P<IAudioFormat> plain = handler->createAudioFormat(toURI(named("a")), 44100, 2, 2),
                          format = boxed->createAudioFormat(toURI(named("b")), 44100, 2, 2);
    EXPECT_EQ(peru::interfaceCast<IFormatSettings>(plain)->getUsedSettings(),
              peru::interfaceCast<IFormatSettings>(format)->getUsedSettings());
    format->open();
    format->writeAudioChunk(makeChunk(makeMusic({}, 5000)));
    peru::interfaceCast<IDiscardable>(format)->discard();
    EXPECT_FALSE(std::filesystem::exists(named("b"))) << "discarded";
}

INSTANTIATE_TEST_SUITE_P(Formats, Boxed, testing::ValuesIn(kFormatCases), printName);

TEST_F(CPluginTest, BoxedSettings_OutliveTheirProcess) {
    const auto boxed = peru::make<CPluginHandler>(context, true);
    writeFile(folder / "x.flac", makeMusic({}, 50'000));
    const P<IAudioSource> source = boxed->createAudioSource(toURI(folder / "x.flac"), 44100, 2, 2, true);
    peru::interfaceCast<IMediaDescription>(source)->setDeliveredFormat(22050, 1, 3);
    peru::interfaceCast<ISalvage>(source)->setSalvage(true);
    source->setStartTime(0.25);
    const std::string expected = readAll(source);
    EXPECT_NEAR(static_cast<double>(expected.size()), (25'000 - 0.25 * 22'050) * 3, 2 * 3);
    endChildren(SIGKILL);
    EXPECT_THROW(source->skipToTime(0.0), CSonoraError);
    source->close();
    source->open();
    EXPECT_TRUE(readAll(source) == expected);
    EXPECT_TRUE(peru::interfaceCast<ISalvage>(source)->getSalvage());
}

} // namespace

} // namespace tests
