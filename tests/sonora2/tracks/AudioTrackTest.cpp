#include "sonora2/tracks/AudioTrack.h"

#include "peru/uri/URI.h"
#include "sonora2/context/LogManager.h"
#include "sonora2/media/SilentAudioSource.h"
#include "sonora2/tracks/TrackCommands.h"
#include "sonora2/tracks/TrackSupport.h"

#include <gtest/gtest.h>

namespace {

using namespace tests;
using namespace sonora2;
using audio::CAudioTrack;

// Negates every sample and records its configuration.
class CNegator : public peru::CObject, public audio::IAudioEqualizer, public audio::IAudioToolsHandler {
public:
    static inline std::string s_calls;
    void configure(int rate, int bytes, int channels) override {
        s_calls += "configure " + std::to_string(rate) + " " + std::to_string(bytes) + " " +
                   std::to_string(channels) + "\n";
    }
    void select(int preset) override { s_calls += "select " + std::to_string(preset) + "\n"; }
    void process(uint8_t* data, int64_t bytes) override {
        for (int64_t i = 0; i < bytes; ++i) data[i] = static_cast<uint8_t>(~data[i]);
    }
    P<audio::IAudioEqualizer> createEqualizer() override { return peru::make<CNegator>(); }
    static P<audio::IAudioToolsHandler> create() { return peru::make<CNegator>(); }
};

class AudioTrack : public testing::Test {
protected:
    void TearDown() override { audio::setAudioToolsHandlerFactory(nullptr); }

    static int16_t firstSample(const P<audio::IAudioChunk>& chunk) {
        return *reinterpret_cast<const int16_t*>(chunk->getData());
    }

    P<audio::CSonoraContextAudio> context = peru::make<audio::CSonoraContextAudio>();
    P<CNoiseSource> source = peru::make<CNoiseSource>(SNoise{});
    P<CAudioTrack> track = peru::make<CAudioTrack>(context, source, false, 10.0, 1.0, 0, nullptr, "me");
};

TEST_F(AudioTrack, EndedSource_GivesASecondOfSilenceAtEachCall) {
    EXPECT_FALSE(track->getNextAudioChunk()) << "closed";
    track->open();
    while (!source->isEOF()) track->getNextAudioChunk();
    for (int i = 0; i < 3; ++i) {
        const P<audio::IAudioChunk> chunk = track->getNextAudioChunk();
        EXPECT_EQ(chunk->getTimestamp(), 0.0);
        EXPECT_EQ(bytesOf(chunk), std::string(16000, '\0'));
    }
    track->close();
    EXPECT_FALSE(source->isOpened());
}

TEST_F(AudioTrack, Skip_CountsFromTheTracksStartAndOnlyWithinIt) {
    track->open();
    const struct {
        double time;
        int64_t frame; // of the next sample; -1: the skip is ignored
    } cases[] = {{10.5, 4000},  {9.99, -1}, {10.0, 0},         {11.0, -2},
                 {10.25, 2000}, {11.1, -1}, {std::nan(""), -1}};
    int64_t next = 0;
    for (const auto& c : cases) {
        track->processCommand(peru::make<common::CSkipToTimeCommand>(c.time)->cloneCommand());
        if (c.frame == -2) {
            EXPECT_TRUE(source->isEOF()) << "the end belongs to the track";
            continue;
        }
        if (c.frame >= 0) next = c.frame;
        const P<audio::IAudioChunk> chunk = track->getNextAudioChunk();
        EXPECT_EQ(firstSample(chunk), noiseAt(1, next, 0)) << c.time;
        next += chunk->getSize() / 2;
    }
}

TEST_F(AudioTrack, OpenCommand_OpensOnceAndClosesAgain) {
    for (const char* target : {"someone else", "", "me"})
        track->processCommand(peru::make<common::COpenThreadIndependentCommand>(target)->cloneCommand());
    EXPECT_TRUE(track->isOpened());
    EXPECT_EQ(source->opens, 1);
    track->processCommand(peru::make<common::COpenThreadIndependentCommand>("me", true)->cloneCommand());
    EXPECT_FALSE(track->isOpened());
}

TEST_F(AudioTrack, Equalizer_ComesFromTheAudioTools) {
    track->setEqualizerPreset(4);
    track->open();
    EXPECT_EQ(firstSample(track->getNextAudioChunk()), noiseAt(1, 0, 0)) << "no audio tools yet";
    const std::string log =
        peru::CString::toStdString(P<common::CLogManager>(context->getLogManager())->getDocument());
    EXPECT_NE(log.find("CAudioTrack: no audio tools, equalizer preset 4 is ignored"), std::string::npos);
    track->close();

    audio::setAudioToolsHandlerFactory(CNegator::create);
    CNegator::s_calls.clear();
    track->open();
    for (const char* target : {"someone else", "me"})
        track->processCommand(
            peru::make<common::CSetAudioEqualizerCommand>(target, target[0] == 'm' ? 7 : 8)->cloneCommand());
    EXPECT_EQ(firstSample(track->getNextAudioChunk()), ~noiseAt(1, 0, 0));
    EXPECT_EQ(CNegator::s_calls, "configure 8000 2 1\nselect 4\nselect 7\n");
    track->close();
    track->setEqualizerPreset(0);
    track->open();
    EXPECT_EQ(firstSample(track->getNextAudioChunk()), noiseAt(1, 0, 0));
}

TEST_F(AudioTrack, DebugText_TellsItsEffects) {
    track->setFadeTimes(0.25, 0.5);
    EXPECT_EQ(peru::CString::toStdString(track->getDebugText()),
              "CAudioTrack: uri: NULL (silent) Effects: "
              "\n  VolumeChange: Time: 0.00s - 0.25s  Factors 0.00 - 1.00s"
              "\n  VolumeChange: Time: 0.50s - 1.00s  Factors 1.00 - 0.00s");
    track->setFadeTimes(0.0, 0.0);
    track->setURI(peru::make<peru::CURI>("file:///a.wav"));
    EXPECT_EQ(peru::CString::toStdString(track->getDebugText()), "CAudioTrack: uri: file:///a.wav Effects: ");
}

TEST_F(AudioTrack, Speed_ThatIsNoneIsRefused) {
    for (double speed : {-1.0, 1e9, 1e-9, std::nan("")}) {
        track->setSpeed(speed);
        track->open();
        EXPECT_NE(errorOf([&] { track->getNextAudioChunk(); }), "") << speed;
    }
}

TEST(SilentAudioSource, Chunks_AreTheSameBlockUntilTheEnd) {
    auto silence = peru::make<CSilentAudioSource>(peru::make<peru::CMemoryManager>(), 0.25, 8000, 2, 2);
    silence->skipToTime(0.10006);
    const P<audio::IAudioChunk> first = silence->getNextAudioChunk();
    EXPECT_EQ(first->getTimestamp(), 0.1) << "whole frames, truncated";
    EXPECT_EQ(bytesOf(first), std::string(2000, '\0'));
    int chunks = 1;
    for (; !silence->isEOF(); ++chunks)
        EXPECT_EQ(silence->getNextAudioChunk()->getMemoryBlock(), first->getMemoryBlock());
    EXPECT_EQ(chunks, 3);
    EXPECT_FALSE(silence->getNextAudioChunk());
    silence->open();
    EXPECT_EQ(silence->getNextAudioChunk()->getTimestamp(), 0.0);
    EXPECT_EQ(text(silence->getURI()->getAsString()) + text(silence->getPluginName()), "CSilentAudioSource");
    EXPECT_EQ(silence->getAudioStreamInfos()->getStreamCount(), 1);
    EXPECT_EQ(silence->getAudioStreamInfos()->getStreamInfo(0)->getStreamIndex(), 0);
}

} // namespace
