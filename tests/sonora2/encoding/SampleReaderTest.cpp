#include "sonora2/encoding/SampleReader.h"

#include "sonora2/ScriptedMedia.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/context/SonoraError.h"

#include <gtest/gtest.h>

#include <random>

namespace {

using peru::make;
using peru::P;
using sonora2::common::CSampleReader;
using tests::CScriptedSource;

class SampleReader : public testing::Test {
protected:
    P<sonora2::common::ISonoraContext> context = make<sonora2::audio::CSonoraContextAudio>();
    P<CScriptedSource> source = make<CScriptedSource>();

    P<CSampleReader> makeReader() { return make<CSampleReader>(context, source); }
};

TEST_F(SampleReader, DeliversTheSameBytesHoweverTheSourceCutsThem) {
    std::mt19937 random(1);
    for (int round = 0; round < 50; ++round) {
        source = make<CScriptedSource>();
        source->channels = 1 + static_cast<int>(random() % 6);
        source->bytesPerSample = 1 + static_cast<int>(random() % 4);
        const size_t frameBytes = static_cast<size_t>(source->channels * source->bytesPerSample);
        source->media = tests::patternBytes(frameBytes * (random() % 5000));
        source->cuts.clear();
        // Chunks may end inside a frame; empty chunks are valid.
        for (int i = 0; i < 7; ++i) source->cuts.push_back(random() % 3000);
        source->cuts.push_back(1);
        source->open();
        const P<CSampleReader> reader = makeReader();
        std::string read;
        int64_t position = 0;
        while (reader->hasSamples()) {
            const int frames = 1 + static_cast<int>(random() % 700);
            const P<sonora2::audio::IAudioChunk> chunk = reader->getSamples(frames);
            if (!chunk) continue;
            EXPECT_DOUBLE_EQ(chunk->getTimestamp(), static_cast<double>(position) / source->rate);
            position += chunk->getSize() / frameBytes;
            read += tests::bytesOf(chunk);
            EXPECT_TRUE(chunk->getSize() == frames * frameBytes || read.size() == source->media.size());
        }
        EXPECT_EQ(read, source->media);
        EXPECT_EQ(reader->getPosition(), position);
        EXPECT_FALSE(reader->getSamples(4608));
    }
}

TEST_F(SampleReader, ClosesWhatItOpenedAlsoAfterAFailure) {
    EXPECT_FALSE(makeReader()->hasSamples());
    EXPECT_FALSE(source->isOpened()) << "it was closed before";
    source->beforeFormat = [] { throw sonora2::common::CSonoraError("no header"); };
    for (const bool wasOpened : {false, true}) {
        if (wasOpened) source->open();
        EXPECT_EQ(tests::errorOf([&] { makeReader(); }), "no header");
        EXPECT_EQ(source->isOpened(), wasOpened);
    }
}

TEST_F(SampleReader, TellsNoFramesFromNothingLeft) {
    source->media = tests::patternBytes(4000);
    source->open();
    const P<CSampleReader> reader = makeReader();
    ASSERT_TRUE(reader->getSamples(10)); // leaves 240 frames of the first cut in the buffer
    const P<sonora2::audio::IAudioChunk> none = reader->getSamples(0);
    ASSERT_TRUE(none);
    EXPECT_EQ(none->getSize(), 0u);
    EXPECT_DOUBLE_EQ(none->getTimestamp(), 10.0 / 44100);
    EXPECT_THROW(reader->getSamples(-1), peru::CException);
    EXPECT_EQ(reader->getPosition(), 10);
}

TEST_F(SampleReader, StartsAgainAfterAReset) {
    source->media = tests::patternBytes(8000);
    source->open();
    const P<CSampleReader> reader = makeReader();
    const std::string before = tests::bytesOf(reader->getSamples(100));
    reader->reset();
    EXPECT_FALSE(source->isOpened());
    EXPECT_EQ(reader->getPosition(), 0);
    source->open();
    const P<sonora2::audio::IAudioChunk> again = reader->getSamples(100);
    ASSERT_TRUE(again);
    EXPECT_EQ(again->getTimestamp(), 0.0);
    EXPECT_EQ(tests::bytesOf(again), before);
}

TEST_F(SampleReader, RefusesAFaultySource) {
    source->media = tests::patternBytes(400);
    source->open();
    source->emptyBeforeEnd = true;
    const P<CSampleReader> reader = makeReader();
    EXPECT_EQ(tests::errorOf<sonora2::common::CSonoraError>([&] { reader->getSamples(10); }),
              "CSampleReader: AudioChunk=NULL but Source is not EOF!");

    source->channels = 0;
    EXPECT_THROW(makeReader(), sonora2::common::CSonoraError);
}

// The source may reach its end with the empty chunk.
TEST_F(SampleReader, TakesAnEmptyChunkAtTheEndForTheEnd) {
    source->media = tests::patternBytes(400);
    source->open();
    source->emptyBeforeEnd = true;
    source->eofAnswers = {false, true, true};
    EXPECT_FALSE(makeReader()->getSamples(10));
}

} // namespace
