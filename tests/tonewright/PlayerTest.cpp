#include "tonewright/Player.h"
#include "Library.h"
#include "peru/Errors.h"
#include "support/ScriptedDevice.h"
#include "tonewright/ICallbackTargets.h"

#include <gmock/gmock.h>

#include <random>

namespace {

using namespace tests;
using testing::Contains;
using testing::Each;
using testing::Field;
using Clock = std::chrono::steady_clock;

double secondsSince(Clock::time_point start) {
    return std::chrono::duration<double>(Clock::now() - start).count();
}

template <class Condition> bool becomes(Condition condition) {
    const Clock::time_point start = Clock::now();
    while (!condition() && secondsSince(start) < 20.0)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    return condition();
}

// The bytes of a source with that script, followed by the closing silence.
std::string playedBytes(const SFakeSource& script) {
    const auto source = peru::make<CFakeSource>(script);
    source->open();
    std::string bytes = readAll(source);
    const auto silence = static_cast<size_t>(5 * script.rate * script.channels * script.bytesPerSample);
    return bytes.append(silence, script.bytesPerSample == 1 ? '\x80' : '\0');
}

// A player with its device and source.
struct SPlayer {
    // With a time limit for stop(), the player does not come from the export.
    explicit SPlayer(P<CFakeSource> from, double speed = 200.0, uint32_t stopMilliseconds = 0)
        : device(peru::make<CScriptedOutDevice>(speed)), source(std::move(from)) {
        CScriptedSystem system(device);
        handle = wrap(source);
        if (stopMilliseconds == 0)
            player.reset(TONEWRIGHT_CreatePlayerFromAudioSource(handle.get()));
        else
            player = wrap(peru::make<tonewright::CPlayer>(source, stopMilliseconds));
    }
    explicit SPlayer(const SFakeSource& script, double speed = 200.0, uint32_t stopMilliseconds = 0)
        : SPlayer(peru::make<CFakeSource>(script), speed, stopMilliseconds) {}

    int32_t play() { return TONEWRIGHT_Player_Play(player.get()); }
    int32_t pause() { return TONEWRIGHT_Player_Pause(player.get()); }
    int32_t stop() { return TONEWRIGHT_Player_Stop(player.get()); }
    void setCallback(TONEWRIGHT_PlayerCallback callback) {
        EXPECT_EQ(TONEWRIGHT_Player_SetCallback(player.get(), callback), 0);
    }

    P<CScriptedOutDevice> device;
    P<CFakeSource> source;
    CHandle handle;
    CHandle player;
};

struct SReport {
    double duration, position;
    int32_t state;
};
std::mutex g_mutex;
std::vector<SReport> g_reports;
void keepReport(double duration, double position, int32_t state) {
    std::scoped_lock lock(g_mutex);
    g_reports.push_back({duration, position, state});
}
std::vector<SReport> takeReports() {
    std::scoped_lock lock(g_mutex);
    return std::exchange(g_reports, {});
}
size_t countReports() {
    std::scoped_lock lock(g_mutex);
    return g_reports.size();
}

void throwInt(double, double, int32_t) {
    throw 42;
}
std::atomic<bool> g_isBlocking{false};
void blockASecond(double, double, int32_t) {
    g_isBlocking = true;
    std::this_thread::sleep_for(std::chrono::seconds(1));
}

class CChunklessSource : public CFakeSource {
public:
    using CFakeSource::CFakeSource;
    P<sonora2::audio::IAudioChunk> getNextAudioChunk() override { return nullptr; }
};
// States more than it delivers.
class CShortSource : public CFakeSource {
public:
    using CFakeSource::CFakeSource;
    double getDuration() override { return 1e6; }
};

class Player : public CLibraryTest {
protected:
    void SetUp() override {
        CLibraryTest::SetUp();
        takeReports();
    }

private:
    // A player that plays again looks for the default device; there is no other than the test's own.
    CScriptedSystem m_noDevices{nullptr};
};

TEST_F(Player, Play_DeliversTheSourceUnchangedAndThenSilence) {
    SFakeSource plain, bytes, wide, slow, empty;
    plain.frames = 5500;
    bytes.bytesPerSample = 1;
    wide.bytesPerSample = 3;
    wide.channels = 1;
    slow.chunkFrames = 100; // 0.1 s of sound, which lasts half a millisecond here
    slow.onRead = [] { std::this_thread::sleep_for(std::chrono::milliseconds(20)); };
    empty.frames = 0;
    SFakeSource big;
    big.rate = 48000;
    big.frames = 48000 * 60; // more than the queue holds
    big.chunkFrames = 48000;

    std::vector<std::pair<SFakeSource, P<CFakeSource>>> cases;
    for (const SFakeSource& script : {plain, bytes, wide, slow, empty, big})
        cases.emplace_back(script, peru::make<CFakeSource>(script));
    cases.emplace_back(plain, peru::make<CShortSource>(plain));

    std::vector<std::thread> threads;
    for (const auto& [script, source] : cases) {
        auto player = std::make_shared<SPlayer>(source);
        player->setCallback(script.frames == 5500 ? nullptr : keepReport);
        threads.emplace_back([p = std::move(player), script = script] {
            for (int round = 0; round < 2; ++round) {
                EXPECT_EQ(p->play(), 0);
                EXPECT_TRUE(p->device->written() == playedBytes(script)) << script.bytesPerSample;
                EXPECT_EQ(p->device->getStatus(), 0);
                EXPECT_FALSE(p->source->isOpened());
                EXPECT_EQ(p->stop(), 0) << "nothing is left to be stopped";
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
}

TEST_F(Player, Play_TellsEveryFailureAndCanBeTriedAgain) {
    SFakeSource good, wide, unreadable, unopenable;
    good.frames = 20000;
    wide.bytesPerSample = 4;
    unreadable.onRead = [] { throw peru::CError("scratched"); };
    unopenable.onOpen = [] { throw peru::CError("locked"); };
    struct SCase {
        const char* reason;
        P<CFakeSource> source;
        TONEWRIGHT_PlayerCallback callback;
        bool isGone;
        bool hasPlayed; // then a stop times out
    };
    for (const SCase& c : std::initializer_list<SCase>{
             {"scratched", peru::make<CFakeSource>(unreadable), nullptr, false, true},
             {"locked", peru::make<CFakeSource>(unopenable), nullptr, false, false},
             {"CPlayer: source return Chunk=NULL but is not EOF", peru::make<CChunklessSource>(good), nullptr,
              false, true},
             {"32 Bits are not supported", peru::make<CFakeSource>(wide), nullptr, false, false},
             {"the device has gone", peru::make<CFakeSource>(good), nullptr, true, true},
             {"unknown", peru::make<CFakeSource>(good), throwInt, false, true}}) {
        SPlayer p(c.source);
        p.setCallback(c.callback);
        for (int round = 0; round < 2; ++round) {
            if (c.isGone) p.device->remove();
            log->take();
            EXPECT_EQ(p.play(), 9);
            EXPECT_THAT(log->take(), Contains(SLine{5, "", c.reason}));
            EXPECT_EQ(p.device->getStatus(), 0) << c.reason;
            EXPECT_FALSE(c.source->isOpened()) << c.reason;
        }
        const Clock::time_point start = Clock::now();
        if (!c.hasPlayed) {
            EXPECT_EQ(p.stop(), 0);
        }
        p.player.reset();
        EXPECT_LT(secondsSince(start), 2.0) << "the end of a player does not wait: " << c.reason;
    }
}

TEST_F(Player, Stop_WaitsInVainAfterAFailureOnce) {
    static_assert(tonewright::CPlayer::kStopMilliseconds == 10000, "as its message says");
    SPlayer p(SFakeSource{}, 200.0, 100);
    p.setCallback(throwInt);
    EXPECT_EQ(p.play(), 9);
    const Clock::time_point start = Clock::now();
    EXPECT_EQ(p.stop(), 9);
    EXPECT_GE(secondsSince(start), 0.1);
    EXPECT_THAT(log->take(), Contains(SLine{5, "", "playerthread could not be stopped in 10seconds"}));
    EXPECT_EQ(p.stop(), 0);
    p.setCallback(nullptr);
    EXPECT_EQ(p.play(), 0);
}

TEST_F(Player, Creation_NamesWhatIsMissing) {
    struct SCase {
        const char* reason;
        std::function<void(CScriptedOutDevice&)> change;
        const char16_t* uri; // null: a player of a source
    };
    const auto none = [](int32_t, int32_t, int32_t) -> P<CAudioFormat> { return nullptr; };
    const auto other = [](int32_t, int32_t, int32_t) { return peru::make<CAudioFormat>(48000, 2, 16); };
    const SCase cases[] = {{"CPlayer::init could not open audio device", nullptr, nullptr},
                           {"CPlayer::init could not open audio device", nullptr, u"file:///a.tst"},
                           {"CPlayer::init could not find format for audio device",
                            [&](auto& device) { device.takes = none; }, u"file:///a.tst"},
                           {"CPlayer::init could not find format for audio device",
                            [&](auto& device) { device.takes = other; }, nullptr},
                           {"CPlayer::init could not open source", [](auto&) {}, u"file:///a.unknown"},
                           {"CPlayer::init could not open source", [](auto&) {}, u"file:///refuse.tst"},
                           {"refuse.tst: not today", [](auto&) {}, u"file:///refuse.tst"}};
    for (const SCase& c : cases) {
        const auto device = c.change ? peru::make<CScriptedOutDevice>() : nullptr;
        if (c.change) c.change(*device);
        CScriptedSystem system(device);
        log->take();
        const CHandle source = wrap(peru::make<CFakeSource>(SFakeSource{}));
        EXPECT_FALSE(CHandle(c.uri ? TONEWRIGHT_CreatePlayerFromURI(c.uri)
                                   : TONEWRIGHT_CreatePlayerFromAudioSource(source.get())));
        EXPECT_THAT(log->take(), Contains(SLine{5, "", c.reason}));
    }
    // A file is decoded to the format that the device offers instead of 44100 Hz, two channels, two bytes.
    const auto device = peru::make<CScriptedOutDevice>();
    device->takes = [](int32_t rate, int32_t bytes, int32_t channels) {
        EXPECT_EQ(std::vector({rate, bytes, channels}), std::vector({44100, 2, 2}));
        return peru::make<CAudioFormat>(48000, 1, 8);
    };
    CScriptedSystem system(device);
    const CHandle player(TONEWRIGHT_CreatePlayerFromURI(u"file:///a.tst"));
    EXPECT_EQ(TONEWRIGHT_Player_Play(player.get()), 0);
    EXPECT_EQ(device->written().size(), 48000u + 5 * 48000u);
}

TEST_F(Player, StoppedPlayer_AnswersAtOnce) {
    SPlayer p(SFakeSource{});
    const Clock::time_point start = Clock::now();
    EXPECT_EQ(p.stop(), 0);
    EXPECT_EQ(p.device->opens, 0);
    p.setCallback(keepReport);
    EXPECT_EQ(p.pause(), 0);
    EXPECT_EQ(p.device->getStatus(), 1) << "nothing plays, but the device runs";
    EXPECT_EQ(takeReports().at(0).state, TONEWRIGHT_PLAYER_PLAYING);
    EXPECT_EQ(p.stop(), 0);
    EXPECT_EQ(p.device->getStatus(), 0);
    EXPECT_LT(secondsSince(start), 2.0);
    EXPECT_EQ(p.pause(), 0);
    EXPECT_EQ(p.play(), 0) << "from a running device";
    EXPECT_TRUE(p.device->written() == playedBytes(SFakeSource{}));
    EXPECT_EQ(p.pause(), 0);
    p.player.reset();
    EXPECT_FALSE(p.device->isOpened()) << "without a stop";
}

TEST_F(Player, Pause_StopsTheSoundAndLosesNothing) {
    SFakeSource script;
    script.frames = 100000;
    SPlayer p(script, 50.0);
    p.setCallback(keepReport);
    std::thread player([&] { EXPECT_EQ(p.play(), 0); });
    ASSERT_TRUE(becomes([&] { return p.device->getPosition() > 1.0; }));
    EXPECT_EQ(p.play(), 9) << "it plays already";
    EXPECT_THAT(log->take(), Contains(SLine{5, "", "CPlayer::play the player is playing already"}));
    EXPECT_EQ(p.pause(), 0);
    const double position = p.device->getPosition();
    takeReports();
    ASSERT_TRUE(becomes([&] { return countReports() >= 7; })) << "reports go on";
    for (const SReport& report : takeReports()) {
        EXPECT_EQ(report.state, TONEWRIGHT_PLAYER_PAUSED);
        EXPECT_EQ(report.duration, 100.0);
        EXPECT_EQ(report.position, position);
    }
    EXPECT_EQ(p.pause(), 0);
    player.join();
    const std::vector<SReport> reports = takeReports();
    EXPECT_EQ(reports.front().state, TONEWRIGHT_PLAYER_PLAYING);
    EXPECT_EQ(reports.back().state, TONEWRIGHT_PLAYER_STOPPED);
    EXPECT_EQ(reports.back().position, 0.0);
    EXPECT_TRUE(p.device->written() == playedBytes(script));
    EXPECT_EQ(p.device->opens, 1);
}

TEST_F(Player, Stop_ReturnsSoonWhateverGoesOn) {
    SFakeSource script, slow;
    script.frames = slow.frames = 1 << 30;
    slow.onRead = [] { std::this_thread::sleep_for(std::chrono::milliseconds(300)); };
    struct SCase {
        SFakeSource script;
        TONEWRIGHT_PlayerCallback callback;
        int pauses;
        double limit; // seconds
    };
    for (const SCase& c : std::initializer_list<SCase>{{script, nullptr, 0, 2.0},
                                                       {slow, nullptr, 0, 2.0},
                                                       {script, nullptr, 1, 2.0},
                                                       {slow, nullptr, 2, 3.0},
                                                       {script, blockASecond, 0, 9.0}}) {
        SPlayer p(c.script, 1.0);
        p.setCallback(c.callback);
        g_isBlocking = false;
        std::thread player([&] { EXPECT_EQ(p.play(), 0); });
        ASSERT_TRUE(becomes([&] { return c.callback ? g_isBlocking.load() : !p.device->written().empty(); }));
        p.setCallback(nullptr); // the call under way still ends on the old one
        const Clock::time_point start = Clock::now();
        for (int i = 0; i < c.pauses; ++i) EXPECT_EQ(p.pause(), 0);
        EXPECT_EQ(p.stop(), 0);
        EXPECT_LT(secondsSince(start), c.limit);
        EXPECT_EQ(p.device->getStatus(), 0);
        EXPECT_GE(p.device->stops, 1) << "also after a pause, in which the stream runs on";
        EXPECT_FALSE(p.source->isOpened());
        player.join();
    }
}

TEST_F(Player, Player_OutlivesItsHandleWhileItPlays) {
    SFakeSource script;
    script.frames = 20000;
    auto p = std::make_unique<SPlayer>(script);
    const P<CScriptedOutDevice> device = p->device;
    std::thread player([handle = p->player.get(), &device, &script] {
        EXPECT_EQ(TONEWRIGHT_Player_Play(handle), 0);
        EXPECT_TRUE(device->written() == playedBytes(script));
    });
    ASSERT_TRUE(becomes([&] { return device->starts > 0; }));
    p.reset();
    player.join();
    EXPECT_FALSE(device->isOpened());
}

TEST_F(Player, Threads_MayCallEverythingAtOnce) {
    SFakeSource script;
    script.frames = 3000;
    SPlayer p(script);
    const Clock::time_point start = Clock::now();
    std::vector<std::thread> threads;
    std::atomic<int> left{4};
    for (unsigned seed = 1; seed <= 4; ++seed)
        threads.emplace_back([&p, &left, start, seed] {
            std::minstd_rand random(seed);
            while (secondsSince(start) < 3.0) {
                const unsigned turn = random() % 8;
                if (turn < 2) {
                    p.play(); // may fail: another thread plays
                } else if (turn == 2) {
                    EXPECT_EQ(p.stop(), 0);
                } else if (turn == 4) {
                    const auto control = behind<tonewright::IPlayerControl>(p.player);
                    control->seek(random() % 3);
                    control->setVolume(random() % 3);
                } else if (turn == 3) {
                    p.setCallback(random() % 2 ? keepReport : nullptr);
                } else {
                    EXPECT_EQ(p.pause(), 0);
                    std::this_thread::sleep_for(std::chrono::microseconds(random() % 20000));
                }
            }
            EXPECT_EQ(p.stop(), 0); // another thread may have paused the last play
            --left;
        });
    // Stops the thread that is still playing when the others are done.
    for (; left > 0; std::this_thread::sleep_for(std::chrono::milliseconds(20)))
        if (secondsSince(start) > 3.0) p.stop();
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(p.stop(), 0);
    EXPECT_EQ(p.device->overlaps, 0);
    // A seek of a stopped player is where the next play begins.
    const auto control = behind<tonewright::IPlayerControl>(p.player);
    control->seek(0);
    control->setVolume(1);
    EXPECT_EQ(p.play(), 0);
    EXPECT_TRUE(p.device->written() == playedBytes(script));
}

TEST_F(Player, Queue_IsPlayedWithoutAGap) {
    SFakeSource first, second, third, other;
    first.frames = 5500;
    second.frames = 777;
    third.frames = 4000;
    other.rate = 2000;
    const P<CFakeSource> broken = peru::make<CFakeSource>(SFakeSource{.onOpen = [] { throw 1; }});
    SPlayer p(peru::make<CShortSource>(first));
    const auto control = behind<tonewright::IPlayerControl>(p.player);
    std::vector<std::pair<double, double>> heard; // duration and greatest position
    behind<tonewright::IPlayerProgressTarget>(p.player)->setProgressFunction(
        [&](double duration, double position, int32_t state) {
            if (heard.empty() || heard.back().first != duration) heard.emplace_back(duration, 0.0);
            heard.back().second = std::max(heard.back().second, position);
            // Late: the second source has been read to its end.
            if (duration == 0.777 && control->getSourceIndex() == 1 && third.frames != 0) {
                EXPECT_TRUE(control->enqueue(peru::make<CFakeSource>(third)));
                third.frames = 0;
            }
        });
    EXPECT_FALSE(control->enqueue(peru::make<CFakeSource>(other)));
    EXPECT_TRUE(control->enqueue(broken));
    EXPECT_TRUE(control->enqueue(peru::make<CFakeSource>(second)));
    p.setCallback(keepReport);
    EXPECT_EQ(p.play(), 0);
    third.frames = 4000;
    std::string expected = playedBytes(first);
    expected.resize(5500 * 4);
    EXPECT_TRUE(p.device->written() ==
                expected + playedBytes(second).substr(0, 777 * 4) + playedBytes(third));
    EXPECT_EQ(control->getSourceIndex(), 2);
    EXPECT_EQ(heard.size(), 3u);
    EXPECT_EQ(heard.back().first, 4.0);
    EXPECT_LE(heard.front().second, 5.5) << "the next source has a time line of its own";
    EXPECT_GT(countReports(), 5u) << "the callback without user data is called too";
}

TEST_F(Player, Seek_DropsWhatIsQueued) {
    SFakeSource script;
    script.frames = 100000;
    SPlayer p(script, 20.0);
    const std::string all = playedBytes(script);
    std::string expected;
    // Everything from that second on is in the queue.
    const auto becomesQueued = [&](size_t second) {
        expected += all.substr(second * 4000);
        return becomes([&] { return p.device->written().size() == expected.size(); });
    };
    const auto control = behind<tonewright::IPlayerControl>(p.player);
    control->seek(40.0);
    control->setVolume(0.25);
    EXPECT_THROW(control->setVolume(-1.0), peru::CInvalidArgError);
    EXPECT_THROW(control->seek(std::nan("")), peru::CInvalidArgError);
    EXPECT_EQ(p.device->getGain(), 0.25);
    p.setCallback(keepReport);
    std::thread player([&] { EXPECT_EQ(p.play(), 0); });
    EXPECT_TRUE(becomesQueued(40));
    EXPECT_EQ(p.pause(), 0);
    EXPECT_GT(takeReports().back().position, 40.0);
    control->seek(20.0);
    takeReports();
    EXPECT_TRUE(becomes([&] { return countReports() > 1; }));
    EXPECT_NEAR(takeReports().back().position, 20.0, 1e-6);
    EXPECT_EQ(p.pause(), 0);
    EXPECT_TRUE(becomesQueued(20));
    const Clock::time_point start = Clock::now();
    control->seek(95.0);
    player.join();
    EXPECT_LT(secondsSince(start), 2.0) << "80 seconds of sound were queued";
    EXPECT_TRUE(becomesQueued(95));
    EXPECT_TRUE(p.device->written() == expected);
}

TEST_F(Player, Device_IsExchangedWhileStopped) {
    SPlayer p(SFakeSource{}, 1.0);
    const auto control = behind<tonewright::IPlayerControl>(p.player);
    const auto other = peru::make<CScriptedOutDevice>(), unfit = peru::make<CScriptedOutDevice>();
    unfit->takes = [](int32_t, int32_t, int32_t) { return peru::make<CAudioFormat>(48000, 2, 16); };
    EXPECT_THROW(control->setDevice(unfit), peru::CError);
    control->setVolume(0.5);
    control->setDevice(other);
    EXPECT_EQ(p.play(), 0);
    EXPECT_TRUE(other->written() == playedBytes(SFakeSource{}));
    EXPECT_EQ(other->getGain(), 0.5);
    EXPECT_EQ(p.device->opens, 0);
    // A file is decoded anew to a format of the device.
    CScriptedSystem system(other);
    const CHandle file(TONEWRIGHT_CreatePlayerFromURI(u"file:///a.tst"));
    behind<tonewright::IPlayerControl>(file)->setDevice(unfit);
    EXPECT_EQ(TONEWRIGHT_Player_Play(file.get()), 0);
    EXPECT_EQ(unfit->format->getSampleRate(), 48000);
}

TEST_F(Player, Play_FollowsTheDefaultDevice) {
    for (const bool isChosen : {false, true}) {
        SPlayer p(SFakeSource{});
        behind<tonewright::IPlayerControl>(p.player)->setVolume(0.5);
        if (isChosen) behind<tonewright::IPlayerControl>(p.player)->setDevice(p.device);
        EXPECT_EQ(p.play(), 0);
        const auto other = peru::make<CScriptedOutDevice>(), unfit = peru::make<CScriptedOutDevice>();
        other->name = unfit->name = "other";
        unfit->takes = [](int32_t, int32_t, int32_t) { return peru::make<CAudioFormat>(48000, 2, 16); };
        for (const auto& device : {unfit, other}) {
            CScriptedSystem system(device);
            EXPECT_EQ(p.play(), 0);
        }
        EXPECT_EQ(p.device->opens, isChosen ? 3 : 2);
        EXPECT_EQ(unfit->opens, 0) << "no format of the source: the old device goes on";
        EXPECT_TRUE(other->written() == (isChosen ? "" : playedBytes(SFakeSource{})));
        EXPECT_EQ(other->getGain(), isChosen ? 1.0 : 0.5);
    }
}

} // namespace
