#include "Library.h"
#include "peru/media/ISystem.h"
#include "support/SoundServer.h"
#include "tonewright/RecordingAudioSource.h"

namespace {

using namespace tests;

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
        // Played twice; the server loses samples if it gets no processor in time, so there are more takes.
        int whole = 0;
        for (int take = 0; take < 6 && whole < 2; ++take) {
            ear->open();
            const auto start = std::chrono::steady_clock::now();
            EXPECT_EQ(TONEWRIGHT_Player_Play(player.get()), 0);
            const auto taken = std::chrono::steady_clock::now() - start;
            EXPECT_GE(taken, std::chrono::milliseconds(900));
            EXPECT_LE(taken, std::chrono::seconds(30)) << "the closing silence is not waited for";
            ear->close();
            const std::string heard = readAll(ear);
            if (withoutSilence(heard) == played) ++whole;
        }
        EXPECT_EQ(whole, 2);
    }
    TONEWRIGHT_DeInitAll();
}

} // namespace
