#include "Library.h"
#include "peru/media/ISystem.h"
#include "support/SoundServer.h"
#include "tonewright/RecordingAudioSource.h"

namespace {

using namespace tests;

// Removes silent frames before, after, and where a busy machine misses a buffer: the material itself is never
// silent.
std::string withoutSilence(const std::string& sound) {
    std::string left;
    for (size_t at = 0; at + 4 <= sound.size(); at += 4)
        if (sound.compare(at, 4, std::string(4, '\0')) != 0) left.append(sound, at, 4);
    return left;
}

// The server's input records its output.
TEST(SoundLoop, Player_IsHeardWholeByARecording) {
    CSoundServer server;
    ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK);
    SFakeSource script;
    script.rate = script.frames = CSoundServer::kRate;
    script.chunkFrames = 4000;
    {
        auto ear = peru::make<CRecordingAudioSource>(peru::media::getSystem()->getDefaultInDevice(),
                                                     CSoundServer::kRate, 2, 2);
        ASSERT_TRUE(ear->isValid());
        const CHandle player(
            TONEWRIGHT_CreatePlayerFromAudioSource(wrap(peru::make<CFakeSource>(script)).get()));
        ASSERT_TRUE(player);
        auto source = peru::make<CFakeSource>(script);
        source->open();
        const std::string played = readAll(source);
        for (int round = 0; round < 2; ++round) {
            ear->open();
            const auto start = std::chrono::steady_clock::now();
            EXPECT_EQ(TONEWRIGHT_Player_Play(player.get()), 0);
            const auto taken = std::chrono::steady_clock::now() - start;
            EXPECT_GE(taken, std::chrono::milliseconds(900));
            EXPECT_LE(taken, std::chrono::seconds(5)) << "the closing silence is not waited for";
            ear->close();
            const std::string heard = readAll(ear);
            EXPECT_TRUE(withoutSilence(heard) == played) << heard.size() << " bytes were heard";
        }
    }
    TONEWRIGHT_DeInitAll();
}

} // namespace
