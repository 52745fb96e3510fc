#include "sonora2/tracks/AudioChunkUnifier.h"

#include "sonora2/tracks/AudioChunkUnifierTrack.h"
#include "sonora2/tracks/TrackCommands.h"
#include "sonora2/tracks/TrackSupport.h"

#include <gtest/gtest.h>

namespace {

using namespace tests;
using sonora2::audio::CAudioChunkUnifier;

class ChunkUnifier : public testing::Test {
protected:
    P<sonora2::common::ISonoraContext> context = peru::make<sonora2::audio::CSonoraContextAudio>();
    P<CScriptedSource> source = peru::make<CScriptedSource>();
};

TEST_F(ChunkUnifier, Chunks_AreOfOneLengthAndHoldEveryByte) {
    for (int frames : {1, 7, 250, 999, 1000, 5000}) {
        for (const std::vector<size_t>& cuts :
             std::vector<std::vector<size_t>>{{4}, {4000}, {400, 0, 0, 12}, {1000}, {100000}}) {
            source->media = patternBytes(4 * 2345);
            source->cuts = cuts;
            source->open();
            const auto unifier =
                peru::make<CAudioChunkUnifier>(context, P<sonora2::common::IAudioSource>(source));
            std::string read;
            while (const P<sonora2::audio::IAudioChunk> chunk = unifier->getChunk(frames)) {
                ASSERT_EQ(chunk->getSize(), static_cast<uint32_t>(frames * 4));
                read += bytesOf(chunk);
            }
            std::string expected = source->media;
            expected.resize((2345 + frames - 1) / frames * frames * 4);
            EXPECT_TRUE(read == expected) << frames << " frames at a time";
            EXPECT_FALSE(unifier->getChunk(frames)) << "the end stays the end";
        }
    }
}

TEST_F(ChunkUnifier, Timestamp_IsTheInputsOwn) {
    auto noise = peru::make<CNoiseSource>(SNoise{1, 5000, 8000, 2, {700}});
    noise->open();
    noise->skipToTime(0.25);
    const auto unifier = peru::make<CAudioChunkUnifier>(context, P<sonora2::common::IAudioSource>(noise));
    for (int i = 0; i < 10; ++i)
        EXPECT_NEAR(unifier->getChunk(123)->getTimestamp(), (2000.0 + 123 * i) / 8000, 1e-12);
}

TEST_F(ChunkUnifier, BadInput_EndsInsteadOfHanging) {
    source->media = patternBytes(400);
    source->cuts = {0};
    source->open();
    const auto unifier = peru::make<CAudioChunkUnifier>(context, P<sonora2::common::IAudioSource>(source));
    EXPECT_FALSE(unifier->getChunk(100)) << "empty chunks without end";
    EXPECT_NE(errorOf([&] { unifier->getChunk(-1); }), "");
    source->channels = 0;
    const auto shapeless = peru::make<CAudioChunkUnifier>(context, P<sonora2::common::IAudioSource>(source));
    EXPECT_EQ(errorOf([&] { shapeless->getChunk(100); }),
              "CAudioChunkUnifier: 44100 frames per second of 0 channels of 2 bytes are not a sound format");
}

TEST_F(ChunkUnifier, ForeignFormat_IsConverted) {
    SNoise mono = {3, 8000, 8000, 1, {640}};
    auto noise = peru::make<CNoiseSource>(mono);
    noise->open();
    const auto unifier = peru::make<CAudioChunkUnifier>(context, P<sonora2::common::IAudioSource>(noise));
    unifier->setFormat(16000, 2, 2);
    Samples played;
    while (const P<sonora2::audio::IAudioChunk> chunk = unifier->getChunk(400)) {
        ASSERT_EQ(chunk->getSize(), 1600u);
        append(played, chunk);
    }
    EXPECT_NEAR(static_cast<double>(played.size()), 32000.0, 1000.0) << "twice the rate, two channels";
}

// A track whose medium time differs from its time line.
class CShiftedTrack : public sonora2::audio::CAudioTrack, public sonora2::audio::IMediumTimeTrack {
public:
    using CAudioTrack::CAudioTrack;
    double getMediumTime(double listTime) const override { return listTime - 2.0; }
};

TEST_F(ChunkUnifier, Track_SkipsToTheTimeOfItsMediumAndForgetsWhatItHeld) {
    const SNoise noise = {1, 8000, 8000, 1, {700}};
    for (double shift : {0.0, 2.0}) {
        P<sonora2::audio::IAudioTrack> inner;
        const P<sonora2::common::IAudioSource> input = peru::make<CNoiseSource>(noise);
        if (shift == 0.0)
            inner = peru::make<sonora2::audio::CAudioTrack>(context, input, false, 0.0, 1.0, 0);
        else
            inner = peru::make<CShiftedTrack>(context, input, false, 0.0, 1.0, 0);
        const auto track =
            peru::make<sonora2::audio::CAudioChunkUnifierTrack>(context, inner, 100, 8000, 1, 2);
        EXPECT_FALSE(track->getNextAudioChunk()) << "closed";
        track->processCommand(peru::make<sonora2::common::COpenThreadIndependentCommand>(""));
        ASSERT_TRUE(track->isOpened());
        track->getNextAudioChunk();
        track->processCommand(peru::make<sonora2::common::CSkipToTimeCommand>(0.5 + shift));
        Samples played;
        append(played, track->getNextAudioChunk());
        for (int i = 0; i < 100; ++i) ASSERT_EQ(played[static_cast<size_t>(i)], noiseAt(1, 4000 + i, 0));
        track->processCommand(peru::make<sonora2::common::COpenThreadIndependentCommand>("", true));
        EXPECT_FALSE(track->isOpened());
        EXPECT_EQ(peru::CString::toStdString(track->getDebugText()),
                  "CAudioChunkUnifierTrack:  track: CAudioTrack: uri: NULL (silent) Effects: ");
    }
}

} // namespace
