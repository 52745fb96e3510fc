// Seeking, start times, and conversion.
#include "plugins/PluginFixture.h"

#include "sonora2/context/SonoraError.h"
#include "sonora2/media/ISalvage.h"
#include "sonora2/media/ITwinSource.h"

namespace tests {

namespace {

class Time : public CFormatTest {
protected:
    static constexpr int kFrames = 100003;

    std::filesystem::path writeMusic() {
        writeFile(named(), makeMusic({}, kFrames));
        return named();
    }
};

TEST_P(Time, RandomSkips_EqualTheUnskippedRun) {
    const auto path = writeMusic();
    // The file's own shape, and conversions with short and long filter periods.
    for (const SShape& shape : {SShape{}, SShape{48000, 1, 2}, SShape{22051, 2, 1}, SShape{96000, 6, 2}}) {
        SCOPED_TRACE(std::to_string(shape.rate));
        P<IAudioSource> source = openSource(path, shape);
        ASSERT_TRUE(source);
        const std::string all = readAll(source);
        const int64_t frames = static_cast<int64_t>(all.size()) / shape.frameBytes();
        ASSERT_NEAR(static_cast<double>(kFrames) * shape.rate / 44100.0, static_cast<double>(frames), 0.5);
        std::mt19937 random(7);
        for (int i = 0; i < 40; ++i) {
            const int64_t frame = i == 0 ? 0 : i == 1 ? frames - 1 : static_cast<int64_t>(random() % frames);
            source->skipToTime(static_cast<double>(frame) / shape.rate);
            ASSERT_FALSE(source->isEOF());
            P<IAudioChunk> first = source->getNextAudioChunk();
            ASSERT_TRUE(first);
            EXPECT_NEAR(static_cast<double>(frame) / shape.rate, first->getTimestamp(), 1e-9);
            std::string pcm(reinterpret_cast<const char*>(first->getData()), first->getSize());
            pcm += readAll(source, i % 8 == 0 ? SIZE_MAX : 100000);
            ASSERT_TRUE(all.compare(frame * shape.frameBytes(), pcm.size(), pcm) == 0)
                << "at frame " << frame;
        }
        source->skipToTime(1e9);
        EXPECT_TRUE(source->isEOF());
        EXPECT_FALSE(source->getNextAudioChunk());
        source->skipToTime(0.0);
        EXPECT_TRUE(readAll(source) == all);
    }
}

TEST_P(Time, StartTime_MovesTheBeginning) {
    P<IAudioSource> source = openSource(writeMusic());
    const std::string all = readAll(source);
    source->close();
    const int start = 30001;
    source->setStartTime(start / 44100.0);
    source->open();
    EXPECT_NEAR((kFrames - start) / 44100.0, source->getDuration(), 1e-12);
    P<IAudioChunk> first = source->getNextAudioChunk();
    EXPECT_EQ(0.0, first->getTimestamp());
    EXPECT_EQ(0, std::memcmp(first->getData(), all.data() + start * 4, first->getSize()));
    source->skipToTime(1.0);
    EXPECT_TRUE(readAll(source) == all.substr((start + 44100) * 4));
    source->setStartTime(0.0);
    EXPECT_TRUE(readAll(source) == all);
    EXPECT_THROW(source->setStartTime(-1.0), sonora2::common::CSonoraError);
}

// Another thread may read a part of a file whose frames do not depend on where reading starts.
TEST_P(Time, Twin_DeliversTheSameFrames) {
    using sonora2::common::ITwinSource;
    const auto path = writeMusic();
    const std::string all = read(path);
    P<IAudioSource> source = openSource(path);
    const auto part = peru::interfaceCast<ITwinSource>(source);
    EXPECT_EQ(kFrames, part->getFrameCount());
    source->setStartTime(0.5); // does not count
    for (const auto& [wanted, reached] : {std::pair{-5, 0}, {kFrames + 5, kFrames}, {70001, 70001}}) {
        part->skipToFrame(wanted);
        EXPECT_EQ(reached, part->getFrame());
    }
    P<IAudioSource> twin = part->createTwin();
    EXPECT_TRUE(readAll(source) == all.substr(70001 * 4));
    const std::string direct = "wav rf64 w64 flac mp3"; // without swapped bytes or long memory
    ASSERT_EQ(direct.find(GetParam().extension) != direct.npos, static_cast<bool>(twin));
    if (!twin) return;
    peru::interfaceCast<ITwinSource>(twin)->skipToFrame(50003);
    EXPECT_TRUE(readAll(twin) == all.substr(50003 * 4));
    peru::interfaceCast<sonora2::common::ISalvage>(source)->setSalvage(true);
    EXPECT_FALSE(part->createTwin());
    peru::interfaceCast<sonora2::common::ISalvage>(source)->setSalvage(false);
    writeFile(named("other"), makeMusic({}, 5000));
    std::filesystem::rename(named("other"), path);
    EXPECT_FALSE(part->createTwin()) << "the file has been replaced";
    source->close();
    EXPECT_THROW(part->createTwin(), sonora2::common::CSonoraError);
}

TEST_P(Time, ShapesThatCannotBeHad_AreDeclined) {
    const auto path = writeMusic();
    EXPECT_TRUE(openSource(path, {48000, 2, 3}));
    EXPECT_FALSE(openSource(path, {44100, 5, 2})) << "there is no matrix";
    EXPECT_NE(std::string::npos,
              log->lines.back().find("x." + std::string(GetParam().extension) +
                                     " has 2 channels and cannot be converted to 44100 Hz"));
    EXPECT_FALSE(openSource(named("missing")));
}

TEST_F(CPluginTest, AcceptedFile_StaysOpenIfWanted) {
    using namespace sonora2::common;
    writeFile(folder / "x.wav", makeMusic({}, 100));
    const ISonoraPlugin::SSourceParams params;
    const auto plugin = handler->getPlugin(0);
    for (const bool keep : {true, false})
        EXPECT_EQ(keep,
                  plugin->tryCreateSource(toURI(folder / "x.wav"), kAudioSource, keep, &params)->isOpened());
    EXPECT_FALSE(plugin->tryCreateSource(toURI(folder / "x.wav"), kVideoSource, true, nullptr));
    EXPECT_FALSE(plugin->tryCreateSource(nullptr, kAudioSource, true, nullptr));
}

// The read-ahead thread can be stopped at any moment.
TEST_P(Time, ClosingWhileReadingAhead_StartsAnew) {
    P<IAudioSource> source = openSource(writeMusic());
    const std::string begin = readAll(source, 1);
    for (int i = 0; i < 60; ++i) {
        for (int chunks = i % 4; chunks > 0; --chunks) source->getNextAudioChunk();
        EXPECT_GE(source->getBufferStatus(), 0);
        EXPECT_LE(source->getBufferStatus(), 100);
        source->close();
        source->open();
        ASSERT_TRUE(readAll(source, 1) == begin);
    }
}

// Every channel of a file is converted like a mono file with the same sound.
TEST_F(CPluginTest, ManyChannels_AreConvertedAndStayInPlace) {
    const auto pick = [](const std::string& pcm, const SShape& shape, int channel) {
        std::string picked;
        for (size_t at = channel * shape.bytes; at < pcm.size(); at += shape.frameBytes())
            picked += pcm.substr(at, shape.bytes);
        return picked;
    };
    for (const int channels : {3, 4, 6, 8}) {
        const SShape own{44100, channels, 3};
        const std::string pcm = makeMusic(own, 12011);
        writeFile(folder / "x.wav", pcm, own);
        for (const SShape& shape : {SShape{44100, channels, 2}, SShape{44100, channels, 4},
                                    SShape{48000, channels, 2}, SShape{22050, channels, 3}}) {
            P<IAudioSource> source = openSource(folder / "x.wav", shape);
            ASSERT_TRUE(source);
            const std::string all = readAll(source);
            for (int i = 0; i < channels; ++i) {
                SCOPED_TRACE(std::to_string(shape.rate) + " Hz, channel " + std::to_string(i));
                writeFile(folder / "mono.wav", pick(pcm, own, i), {44100, 1, 3});
                const std::string mono =
                    readAll(openSource(folder / "mono.wav", {shape.rate, 1, shape.bytes}));
                EXPECT_TRUE(pick(all, shape, i) == mono);
            }
            source->skipToTime(0.1);
            EXPECT_TRUE(readAll(source) == all.substr(std::llround(0.1 * shape.rate) * shape.frameBytes()));
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Formats, Time, ::testing::ValuesIn(kFormatCases), printName);

} // namespace

} // namespace tests
