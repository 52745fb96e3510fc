// Seeking, start times, and conversion.
#include "plugins/PluginFixture.h"

#include "sonora2/context/SonoraError.h"

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

// A click keeps its time at any rate, and the length is that of the file.
TEST_P(Time, Conversion_KeepsAClickInPlace) {
    for (int rate : {48000, 22050, 44100, 96000, 32000}) {
        SCOPED_TRACE(rate);
        std::string pcm(kFrames * 4, '\0');
        const int at = 60000;
        for (int i = -2; i <= 2; ++i) { // wide enough for the lowest rate
            const int16_t height = static_cast<int16_t>(24000 * (3 - std::abs(i)) / 3);
            for (int channel = 0; channel < 2; ++channel)
                std::memcpy(&pcm[((at + i) * 2 + channel) * 2], &height, 2);
        }
        P<IAudioFormat> format = makeFormat(named());
        format->setAudioQuality(1.0);
        writeAll(format, pcm);
        const std::string converted = readAll(openSource(named(), {rate, 1, 2}));
        ASSERT_EQ(std::llround(static_cast<double>(kFrames) * rate / 44100.0), converted.size() / 2);
        double weight = 0.0;
        double moment = 0.0;
        for (size_t i = 0; i < converted.size() / 2; ++i) {
            int16_t value;
            std::memcpy(&value, &converted[i * 2], 2);
            const double energy =
                static_cast<double>(value) * value; // squaring makes a codec's noise negligible
            weight += energy;
            moment += energy * static_cast<double>(i);
        }
        // In frames of the delivered rate.
        EXPECT_NEAR(at * (rate / 44100.0), moment / weight, 0.75);
    }
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

TEST_P(Time, AcceptedFile_IsOpenedOnce) {
    const auto path = writeMusic();
    COpenCounter counter(path);
    P<IAudioSource> source = openSource(path);
    EXPECT_TRUE(source->isOpened());
    EXPECT_EQ(kFrames * 4u, readAll(source).size());
    EXPECT_EQ(1, counter.count());
    EXPECT_FALSE(handler->createAudioSource(toURI(path), 44100, 2, 2, false)->isOpened());
    EXPECT_EQ(1, counter.count());
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
