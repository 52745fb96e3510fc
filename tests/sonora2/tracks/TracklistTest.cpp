#include "peru/threads/IMutex.h"
#include "sonora2/context/LogManager.h"
#include "sonora2/tracks/TrackCommands.h"
#include "sonora2/tracks/TrackSupport.h"

#include <gtest/gtest.h>

#include <chrono>
#include <future>
#include <random>
#include <thread>

namespace {

using namespace tests;
using namespace sonora2;
using audio::CAudioTracklist;
using Clock = std::chrono::steady_clock;

constexpr int kRate = 8000;
constexpr int kStep = 400; // 50 ms
constexpr double kStepSeconds = 0.05;

double secondsSince(Clock::time_point start) {
    return std::chrono::duration<double>(Clock::now() - start).count();
}

// Waits for another thread.
template <class Condition> bool becomesTrue(Condition condition) {
    for (const auto start = Clock::now(); secondsSince(start) < 20.0; std::this_thread::yield())
        if (condition()) return true;
    return false;
}

class Tracklist : public testing::Test {
protected:
    P<CAudioTracklist> makeList(bool openInThread, const std::vector<STrackPlan>& plans,
                                double startTime = 0.0) {
        auto list = peru::make<CAudioTracklist>(openInThread, context, kRate, 1, 2, kStep, startTime, 0);
        for (const STrackPlan& plan : plans) list->addTrack(makeTrack(context, plan), plan.start, plan.end);
        return list;
    }
    static Samples pull(const P<CAudioTracklist>& list, int steps = 1) {
        Samples samples;
        for (int i = 0; i < steps; ++i)
            if (const P<audio::IAudioChunk> chunk = list->getNextAudioChunk()) append(samples, chunk);
        return samples;
    }
    static void skip(const P<CAudioTracklist>& list, double time) {
        list->processCommand(peru::make<common::CSkipToTimeCommand>(time));
    }
    std::string getLog() const {
        return peru::CString::toStdString(P<common::CLogManager>(context->getLogManager())->getDocument());
    }

    P<audio::CSonoraContextAudio> context = peru::make<audio::CSonoraContextAudio>();
};

// Tracks begin and end on the list's steps, so that the sound at a time does not depend on how it was
// reached; a bed below them leaves no gaps.
std::vector<STrackPlan> makeGridPlans() {
    std::vector<STrackPlan> plans = {{{99, 20 * kRate}, -1, 0.0, 20.0}};
    for (int i = 0; i < 24; ++i) {
        const double start = i * 0.75, end = start + 0.5 + 0.25 * (i % 5);
        // Media are longer than their tracks: the list ends them.
        plans.push_back({{i + 1, static_cast<int64_t>((end - start) * kRate) + 1500}, i % 4, start, end});
    }
    return plans;
}

TEST_F(Tracklist, Skip_GivesWhatAnUnskippedRunGives) {
    const std::vector<STrackPlan> plans = makeGridPlans();
    const Samples whole = renderList(plans, kRate, 1, kStep);
    for (bool openInThread : {false, true}) {
        const P<CAudioTracklist> list = makeList(openInThread, plans);
        list->open();
        std::mt19937 random(3);
        for (int i = 0; i < 1000; ++i) {
            const size_t step = random() % 400;
            if (i % 7 == 0)
                list->skipToFrame(static_cast<uint32_t>(step * 50));
            else
                skip(list, static_cast<double>(step) * kStepSeconds);
            const Samples played = pull(list, 1 + static_cast<int>(random() % 6));
            const size_t first = step * kStep;
            const Samples expected(whole.begin() + first,
                                   whole.begin() + std::min(first + played.size(), whole.size()));
            ASSERT_TRUE(played == expected) << "skip " << i << " to step " << step;
        }
        skip(list, 1e300);
        EXPECT_FALSE(list->hasMore());
        EXPECT_FALSE(list->getNextAudioChunk());
        for (double time : {-5.0, std::nan("")}) {
            skip(list, time);
            EXPECT_TRUE(pull(list) == Samples(whole.begin(), whole.begin() + kStep));
        }
        list->close();
        EXPECT_EQ(CNoiseSource::s_open, 0);
    }
}

TEST_F(Tracklist, Skip_ToAnySampleGivesThatSample) {
    const SNoise noise = {5, 10 * kRate};
    const P<CAudioTracklist> list = makeList(false, {{noise, 0, 0.0, 10.0}});
    list->open();
    std::mt19937 random(4);
    for (int i = 0; i < 300; ++i) {
        const int64_t frame = random() % 79000;
        skip(list, static_cast<double>(frame) / kRate);
        const P<audio::IAudioChunk> chunk = list->getNextAudioChunk();
        EXPECT_EQ(chunk->getTimestamp(), static_cast<double>(frame) / kRate);
        EXPECT_EQ(*reinterpret_cast<const int16_t*>(chunk->getData()), noiseAt(5, frame, 0));
    }
}

TEST_F(Tracklist, ListInAList_PlaysAndSkipsLikeItsTracks) {
    const std::vector<STrackPlan> plans = {{{1, 4 * kRate}, 0, 1.0, 3.0}, {{2, 4 * kRate}, 1, 1.5, 2.5}};
    const Samples whole = renderList(plans, kRate, 1, kStep);
    std::vector<STrackPlan> inner = plans;
    for (STrackPlan& plan : inner) plan.start -= 1.0, plan.end -= 1.0;
    const P<CAudioTracklist> list = makeList(true, {});
    const P<CAudioTracklist> nested = makeList(false, inner, 1.0);
    list->addTrack(nested, 1.0, 3.0);
    list->open();
    EXPECT_TRUE(pull(list, 1000) == whole);
    skip(list, 2.0);
    EXPECT_TRUE(pull(list, 1000) == Samples(whole.end() - (16000 - 8000) - kStep, whole.end()));
    nested->processCommand(peru::make<common::CEnableTrackCommand>("", false)->cloneCommand());
    EXPECT_FALSE(nested->isOpened());
    EXPECT_EQ(CNoiseSource::s_open, 0);
    skip(list, 2.0);
    EXPECT_EQ(pull(list), Samples(kRate / 100)) << "nothing plays";
}

TEST_F(Tracklist, BadTracksAndFormats_AreRefused) {
    const P<CAudioTracklist> list = makeList(false, {});
    EXPECT_EQ(errorOf([&] { list->addTrack(nullptr, 0.0, 1.0); }),
              "only IAudioTrack items should be added to a CAudioTracklist!");
    const struct {
        int rate, channels, bytes, frames;
    } cases[] = {{0, 2, 2, 100},       {8000, -1, 2, 100},          {8000, 2, 0, 100},
                 {8000, 2, 2, 0},      {8000, 1 << 20, 1 << 12, 1}, {1 << 30, 2, 2, 100},
                 {8000, 2, 2, 1 << 30}};
    for (const auto& c : cases)
        EXPECT_THROW(
            peru::make<CAudioTracklist>(false, context, c.rate, c.channels, c.bytes, c.frames, 0.0, 0),
            peru::CError)
            << c.rate << " " << c.channels << " " << c.bytes << " " << c.frames;
}

TEST_F(Tracklist, BufferStatus_IsTheLowestOfWhatPlays) {
    const P<CAudioTracklist> list =
        makeList(false, {{{30}, 0, 0.0, 1.0}, {{60}, 1, 0.0, 0.5}, {{90}, 2, 2.0, 3.0}});
    list->open();
    EXPECT_EQ(list->getBufferStatus(), 100) << "nothing plays yet";
    pull(list, 2);
    EXPECT_EQ(list->getBufferStatus(), 40);
    skip(list, 0.75);
    EXPECT_EQ(list->getBufferStatus(), 70);
    skip(list, 1.5);
    EXPECT_EQ(list->getBufferStatus(), 100);
}

TEST_F(Tracklist, DebugDocument_TellsTheStateAndEveryTrack) {
    const P<CAudioTracklist> list = makeList(false, {{{1}, 3, 0.5, 1.25}, {{2}, -1, 0.0, 1.0, false}});
    list->open();
    skip(list, 0.75);
    EXPECT_EQ(list->getCurrentFrame(), 750u);
    EXPECT_EQ(tests::text(list->getURI()->getAsString()) + tests::text(list->getDebugText()),
              "CAudioTracklist");
    const std::string text = peru::CString::toStdString(list->getDebugDocument()->printToString());
    for (const char* part :
         {"<CTracklist currentFrame=\"750\" maxFrame=\"1250\" framerateNum=\"1\" framerateDen=\"1000\" "
          "sortindex=\"0\" currentTime=\"0.750000\" maxTime=\"1.250000\">",
          "<tracks>",
          "<track startTime=\"0.500000\" endTime=\"1.250000\" startFrame=\"500\" endFrame=\"1250\" "
          "duration=\"0.750000\" sortIndex=\"3\" enabled=\"true\">",
          "sortIndex=\"-1\" enabled=\"false\">", "CAudioTrack: uri: NULL (silent) Effects:"})
        EXPECT_NE(text.find(part), std::string::npos) << part << " in " << text;
}

// Ten hours: a track plays for 20 s and the next begins 2 s before it ends.
TEST_F(Tracklist, LongList_KeepsOnlyOpenWhatPlaysOrIsDue) {
    for (int lanes : {2, 2000}) {
        std::vector<STrackPlan> plans;
        for (int i = 0; i < 2000; ++i)
            plans.push_back({{i, 20 * kRate, kRate, 1, {4000}}, i % lanes, i * 18.0, i * 18.0 + 20.0});
        const auto start = Clock::now();
        const P<CAudioTracklist> list = makeList(true, plans);
        const double built = secondsSince(start);
        RecordProperty("buildMilliseconds", static_cast<int>(built * 1000));
#ifndef TONEWRIGHT_SANITIZED
        EXPECT_LT(built, 0.2);
#endif
        list->open();
        EXPECT_EQ(CNoiseSource::s_open, 0);
        const auto countDue = [&](double time) {
            return std::count_if(plans.begin(), plans.end(), [&](const STrackPlan& plan) {
                return plan.start < time + 5.0 && plan.end >= time;
            });
        };
        std::mt19937 random(5);
        for (int i = 0; i < 60; ++i) {
            const double time = i < 20 ? i * 2.0 : random() % 36000;
            skip(list, time);
            pull(list);
            ASSERT_TRUE(becomesTrue([&] { return CNoiseSource::s_open == countDue(time); }))
                << CNoiseSource::s_open << " open at " << time << ", not " << countDue(time);
        }
        EXPECT_LT(P<peru::CMemoryManager>(context->getMemoryManager())->getCachedBytes(), 1 << 20);
        list->close();
        EXPECT_EQ(CNoiseSource::s_open, 0);
    }
}

// Blocks every caller until it is released.
class CGate {
public:
    void pass() {
        ++m_waiting;
        m_opened.wait(false);
    }
    void open() {
        m_opened = true;
        m_opened.notify_all();
    }
    std::atomic<int> m_waiting{0};

private:
    std::atomic<bool> m_opened{false};
};

TEST_F(Tracklist, SlowMedium_HoldsUpNobodyBeforeItIsDue) {
    CGate gate;
    std::vector<STrackPlan> plans = {
        {{1, 3 * kRate}, 0, 0.0, 3.0}, {{2, kRate}, 1, 1.0, 2.0}, {{3, kRate}, 2, 1.5, 2.0}};
    plans[1].noise.onOpen = [&] { gate.pass(); };
    const P<CAudioTracklist> list = makeList(true, plans);
    list->open();
    Samples played = pull(list);
    ASSERT_TRUE(becomesTrue([&] { return gate.m_waiting == 1; }));
    auto command = std::async(std::launch::async, [&] {
        list->processCommand(peru::make<common::CSetAudioEqualizerCommand>("", 0));
    });
    // All of this happens while the medium is being opened; otherwise it would never return.
    for (const Samples& more : {pull(list, 5), pull(list, 14)})
        played.insert(played.end(), more.begin(), more.end());
    EXPECT_EQ(played.size(), 20u * kStep);
    list->getBufferStatus();
    gate.open();
    command.get();
    const Samples rest = pull(list, 1000);
    played.insert(played.end(), rest.begin(), rest.end());
    for (STrackPlan& plan : plans) plan.noise.onOpen = [] {};
    EXPECT_TRUE(played == renderList(plans, kRate, 1, kStep));
}

TEST_F(Tracklist, LookAhead_OpensFirstWhatIsDueFirst) {
    const P<peru::IMutex> mutex = peru::getMutexFactory()->createMutex();
    std::vector<int> opened;
    std::vector<STrackPlan> plans;
    for (int i = 0; i < 8; ++i) { // the last lane is due first
        plans.push_back({{i, kRate}, i, 4.0 - i * 0.5, 5.0});
        plans.back().noise.onOpen = [&, i] {
            peru::CMutexLock lock(mutex);
            opened.push_back(i);
        };
    }
    const P<CAudioTracklist> list = makeList(true, plans);
    list->open();
    pull(list);
    EXPECT_TRUE(becomesTrue([&] {
        peru::CMutexLock lock(mutex);
        return opened.size() == plans.size();
    }));
    list->close();
    EXPECT_EQ(opened, (std::vector<int>{7, 6, 5, 4, 3, 2, 1, 0}));
}

TEST_F(Tracklist, MediumThatFails_IsLoggedWhenOpenedAheadAndThrownWhenDue) {
    for (bool openInThread : {true, false}) {
        std::vector<STrackPlan> plans = {{{1, 3 * kRate}, 0, 0.0, 3.0}, {{2, kRate}, 1, 1.0, 2.0}};
        std::atomic<int> tries = 0;
        plans[1].noise.onOpen = [&] {
            ++tries;
            throw peru::CError("the medium is gone");
        };
        const P<CAudioTracklist> list = makeList(openInThread, plans);
        list->open();
        pull(list);
        if (openInThread) {
            ASSERT_TRUE(
                becomesTrue([&] { return getLog().find("the medium is gone") != std::string::npos; }));
        }
        pull(list, 19);
        EXPECT_EQ(tries, openInThread ? 1 : 0) << "not again and again";
        for (int i = 0; i < 2; ++i) EXPECT_EQ(errorOf([&] { pull(list); }), "the medium is gone");
        EXPECT_EQ(errorOf([&] { skip(list, 1.5); }), "the medium is gone");
        skip(list, 2.5);
        EXPECT_EQ(pull(list).size(), 1u * kStep) << "behind it all is well";
        context->setLogManager(peru::make<common::CLogManager>());
    }
}

TEST_F(Tracklist, Close_WaitsForTheMediumThatIsBeingOpenedAndForNothingElse) {
    const auto start = Clock::now();
    const P<CAudioTracklist> idle =
        makeList(true, {{{1, 9 * kRate}, 0, 0.0, 9.0}, {{2, kRate}, 1, 2.0, 3.0}});
    for (int i = 0; i < 20; ++i) {
        idle->open();
        pull(idle);
        idle->close();
    }
    EXPECT_LT(secondsSince(start), 5.0) << "an idle worker is not waited for";

    CGate gate;
    std::vector<STrackPlan> plans = {
        {{1, 9 * kRate}, 0, 0.0, 9.0}, {{2, kRate}, 1, 1.0, 2.0}, {{3, kRate}, 2, 1.0, 2.0}};
    std::atomic<int> others = 0;
    plans[1].noise.onOpen = [&] { gate.pass(); };
    plans[2].noise.onOpen = [&] { ++others; };
    P<CAudioTracklist> list = makeList(true, plans);
    list->open();
    pull(list);
    ASSERT_TRUE(becomesTrue([&] { return gate.m_waiting == 1; }));
    auto closing = std::async(std::launch::async, [&] { list.reset(); });
    EXPECT_EQ(closing.wait_for(std::chrono::milliseconds(20)), std::future_status::timeout);
    gate.open();
    closing.get();
    EXPECT_EQ(others, 0) << "what waited in the queue is not opened any more";
    EXPECT_EQ(CNoiseSource::s_open, 0);
}

TEST_F(Tracklist, PlayerWorkerAndCommands_RunTogether) {
    std::vector<STrackPlan> plans = makeGridPlans();
    for (size_t i = 1; i < plans.size(); i += 5)
        plans[i].noise.onOpen = [] { std::this_thread::sleep_for(std::chrono::milliseconds(3)); };
    const P<CAudioTracklist> list = makeList(true, plans);
    list->open();
    std::atomic<bool> stop = false;
    std::thread player([&] {
        while (!stop) {
            try {
                list->getNextAudioChunk();
            } catch (const peru::CException& error) {
                ADD_FAILURE() << peru::CString::toStdString(error.getDescription());
            }
            list->hasMore();
        }
    });
    std::thread commands([&] {
        std::mt19937 random(8);
        while (!stop) {
            skip(list, static_cast<double>(random() % 20000) / 1000.0);
            list->processCommand(peru::make<common::CSetAudioEqualizerCommand>("", 0));
            list->getBufferStatus();
            if (random() % 50 == 0) {
                list->processCommand(peru::make<common::CEnableTrackCommand>("", false));
                list->processCommand(peru::make<common::CEnableTrackCommand>("", true));
                list->open();
            }
        }
    });
    std::this_thread::sleep_for(std::chrono::seconds(2)); // the length of the run
    stop = true;
    player.join();
    commands.join();
    list->close();
    EXPECT_EQ(CNoiseSource::s_open, 0);
    EXPECT_EQ(getLog().find("logentry"), std::string::npos) << getLog();
}

} // namespace
