#include "Library.h"

#include "sonora2/context/LastFailure.h"
#include "sonora2/context/SonoraError.h"
#include "tonewright/ICallbackTargets.h"

#include <gmock/gmock.h>

#include <atomic>
#include <thread>

namespace {

using namespace tests;
using testing::Contains;
using testing::ElementsAre;

class Exports : public CLibraryTest {
protected:
    static CHandle makeSource(SFakeSource script) { return wrap(peru::make<CFakeSource>(std::move(script))); }
};

TEST_F(Exports, Barrier_TurnsEveryExceptionIntoAValueAndALine) {
    struct SCase {
        std::function<void()> thrower;
        const char* text;
    };
    class CSilentError : public std::exception {
    public:
        const char* what() const noexcept override { return ""; }
    };
    for (const SCase& c :
         std::initializer_list<SCase>{{[] { throw sonora2::common::CSonoraError("broken"); }, "broken"},
                                      {[] { throw peru::CFileNotFoundError(); }, nullptr},
                                      {[] { throw std::runtime_error("out of tape"); }, "out of tape"},
                                      {[] { throw CSilentError(); }, "unknown std::exception"},
                                      {[] { throw 42; }, "unknown"}}) {
        SFakeSource script;
        script.onOpen = c.thrower;
        CHandle source = makeSource(script);
        log->take();
        testing::internal::CaptureStderr();
        EXPECT_EQ(TONEWRIGHT_AudioSource_Open(source.get()), 3);
        const std::string debugOutput = testing::internal::GetCapturedStderr();
        const std::vector<SLine> lines = log->take();
        ASSERT_EQ(lines.size(), 1u);
        EXPECT_EQ(lines[0].level, 5);
        EXPECT_EQ(lines[0].source, "");
        EXPECT_EQ(lines[0].text, c.text ? c.text : lines[0].text);
        EXPECT_NE(lines[0].text, "");
        EXPECT_THAT(debugOutput, testing::HasSubstr(lines[0].text));
        EXPECT_EQ(TONEWRIGHT_AudioSource_IsOpened(source.get()), 0) << "the lock is free again";
    }
}

TEST_F(Exports, Plugins_ThatFailAreSeenByTheHostsLog) {
    EXPECT_FALSE(TONEWRIGHT_CreateAudioSourceFromURI(u"file:///refuse.tst", 44100, 2, 2, 0));
    EXPECT_THAT(log->take(),
                ElementsAre(SLine{3, "",
                                  "tried to open file:///refuse.tst with plugin testplugin_good.\n"
                                  "Opening failed: Error - not today"},
                            SLine{5, "", "refuse.tst: not today"}));
    const sonora2::common::SFailure failure = sonora2::common::getLastFailure();
    EXPECT_EQ(failure.kind, "sonora2::common::CSonoraError");
    EXPECT_EQ(failure.title, "Error");
    EXPECT_EQ(failure.message, "refuse.tst: not today");
    EXPECT_EQ(failure.uri, "file:///refuse.tst");
    EXPECT_FALSE(TONEWRIGHT_CreateAudioSourceFromURI(u"file:///a.tst", 44100, 0, 2, 0));
    EXPECT_THAT(
        log->take(),
        ElementsAre(SLine{5, "", "not all sourceparameter fields are valid for creating an audio source"}));
    EXPECT_FALSE(TONEWRIGHT_CreateAudioSourceFromURI(u"http://[", 44100, 2, 2, 0)) << "no URI";
    EXPECT_FALSE(TONEWRIGHT_CreateAudioSourceFromURI(nullptr, 44100, 2, 2, 0));
    for (int keepOpened : {0, 1}) {
        CHandle source(TONEWRIGHT_CreateAudioSourceFromURI(u"file:///a.tst", 8000, 1, 2, keepOpened));
        EXPECT_EQ(TONEWRIGHT_AudioSource_IsOpened(source.get()), keepOpened);
    }
    TONEWRIGHT_RemoveProxyLogManager(log->getHandle());
    log->take();
    TONEWRIGHT_SetLanguageID(u"xx-nowhere");
    EXPECT_TRUE(log->take().empty());
    TONEWRIGHT_AddProxyLogManager(log->getHandle());
    TONEWRIGHT_SetLanguageID(u"xx-nowhere");
    TONEWRIGHT_SetLanguageID(nullptr);
    EXPECT_THAT(
        log->take(),
        ElementsAre(SLine{5, "", "TONEWRIGHT_SetLanguageID: could not find languageId for xx-nowhere"}));
}

TEST_F(Exports, Format_GetsItsSettingsOnlyWhenTheyAreGiven) {
    struct SCase {
        double quality;
        int32_t nominal, min, max;
        bool setsQuality, setsRates;
    };
    for (const SCase& c : std::initializer_list<SCase>{{0.0, 0, 0, 0, false, false},
                                                       {0.5, 0, 0, 0, true, false},
                                                       {-2.0, 0, -7, 0, false, false},
                                                       {0.0, 0, 0, 64, false, true},
                                                       {0.0, 3, 0, 0, false, true},
                                                       {0.2, 1, 32, 64, true, true}}) {
        CHandle format(TONEWRIGHT_CreateAudioFormatFromURI(u"file:///a.tst", 1000, 2, 2, c.quality, c.nominal,
                                                           c.min, c.max));
        ASSERT_TRUE(format);
        EXPECT_EQ(TONEWRIGHT_AudioFormat_GetEstiamtedFileSize(format.get(), 2.0), 8000);
        const auto made = behind<CFakeFormat>(format);
        EXPECT_EQ(made->quality, c.setsQuality ? c.quality : -1.0);
        EXPECT_THAT(made->bitRates, ElementsAre(c.setsRates ? c.nominal : -1, c.setsRates ? c.min : -1,
                                                c.setsRates ? c.max : -1));
    }
    TONEWRIGHT_SetTempExtension(u".part");
    EXPECT_TRUE(
        CHandle(TONEWRIGHT_CreateAudioFormatFromURI(u"file:///a.tst.part", 1000, 2, 2, 0.0, 0, 0, 0)));
    EXPECT_FALSE(CHandle(TONEWRIGHT_CreateAudioSourceFromURI(u"file:///a.tst.part", 1000, 2, 2, 0)))
        << "only what is written has temporary names";
}

std::vector<double> g_fractions;
std::vector<float> g_samples;
int g_blocksWanted = 1000;

bool collect(TONEWRIGHT_Handle handle, double fraction, const float* samples, int32_t count, void* user) {
    EXPECT_EQ(handle, *static_cast<TONEWRIGHT_Handle*>(user));
    EXPECT_EQ(count, 200) << "a hundred steps of two channels";
    g_fractions.push_back(fraction);
    g_samples.insert(g_samples.end(), samples, samples + count);
    return --g_blocksWanted > 0;
}

TEST_F(Exports, FetchStreamSamples_DeliversTheFirstFrameOfEachStepInWholeBlocks) {
    struct SCase {
        int64_t frames;
        int bytesPerSample;
        double secondsPerStep; // at 1000 frames a second
        int blocksWanted;
        uint8_t result;
        size_t blocks;
    };
    for (const SCase& c : std::initializer_list<SCase>{{2500, 2, 0.010, 99, 1, 2},  // half a block is dropped
                                                       {991, 2, 0.010, 99, 1, 1},   // just the hundredth step
                                                       {990, 2, 0.010, 99, 1, 0},   // 99 steps
                                                       {2500, 2, 0.0109, 99, 1, 2}, // truncated to 10
                                                       {5000, 2, 0.010, 1, 0, 1},   // stopped by the host
                                                       {5000, 2, 0.0005, 99, 0, 0},
                                                       {5000, 2, -1.0, 99, 0, 0},
                                                       {5000, 2, 1e300, 99, 0, 0},
                                                       {5000, 1, 0.010, 99, 0, 0},
                                                       {0, 2, 0.010, 99, 1, 0}}) {
        SFakeSource script;
        script.frames = c.frames;
        script.bytesPerSample = c.bytesPerSample;
        CHandle source = makeSource(script);
        g_fractions.clear();
        g_samples.clear();
        g_blocksWanted = c.blocksWanted;
        TONEWRIGHT_Handle user = source.get();
        EXPECT_EQ(TONEWRIGHT_AudioSource_FetchStreamSamples(source.get(), collect, c.secondsPerStep, &user),
                  c.result)
            << c.frames << " " << c.secondsPerStep;
        ASSERT_EQ(g_fractions.size(), c.blocks) << c.frames << " " << c.secondsPerStep;
        EXPECT_EQ(TONEWRIGHT_AudioSource_IsOpened(source.get()), 1) << "left open";
        for (size_t i = 0; i < g_samples.size(); ++i) {
            const size_t frame = i / 2 * 10, channel = i % 2;
            ASSERT_EQ(g_samples[i], static_cast<float>(frame * 4 + channel) / 32768.0f) << i;
        }
        if (c.blocks) {
            EXPECT_DOUBLE_EQ(g_fractions[0], 990.0 / static_cast<double>(c.frames));
        }
    }
    CHandle source = makeSource({});
    EXPECT_EQ(TONEWRIGHT_AudioSource_FetchStreamSamples(source.get(), nullptr, 0.01, nullptr), 0);
}

std::atomic<int> g_calls{0};
bool goOn(double, int32_t) {
    ++g_calls;
    return true;
}
bool stopAtHalf(double fraction, int32_t) {
    return fraction < 0.5;
}
bool throwInt(double, int32_t) {
    throw 42;
}

TEST_F(Exports, Encode_TellsHowItEnded) {
    enum EFault { kNone, kSource, kFormat };
    struct SCase {
        TONEWRIGHT_EncoderCallback callback;
        double stopsAt, discardsAt; // by a function beside the callback
        EFault fault;
        int32_t result;
        int64_t frames;
    };
    const int64_t all = 100 * 1000;
    for (const SCase& c : std::initializer_list<SCase>{{nullptr, 2.0, 2.0, kNone, 0, all},
                                                       {goOn, 2.0, 2.0, kNone, 0, all},
                                                       {goOn, 0.5, 2.0, kNone, 0, 50688},
                                                       {stopAtHalf, 2.0, 2.0, kNone, 0, 50688},
                                                       {nullptr, 2.0, 0.5, kNone, 0, 50688},
                                                       {nullptr, 2.0, 1.0, kNone, 0, all},
                                                       {nullptr, 2.0, 0.0, kNone, 0, 0},
                                                       {throwInt, 2.0, 2.0, kNone, 11, 0},
                                                       {goOn, 2.0, 2.0, kSource, 11, 0},
                                                       {goOn, 2.0, 2.0, kFormat, 11, 0}}) {
        SFakeSource script;
        script.frames = all;
        if (c.fault == kSource) script.onRead = [] { throw sonora2::common::CSonoraError("scratched"); };
        std::function<void()> onWrite = [] {};
        if (c.fault == kFormat) onWrite = [] { throw std::runtime_error("disk full"); };
        const P<CFakeFormat> format = peru::make<CFakeFormat>(CFakeFormat::takes(1000, 2, 2), onWrite);
        CHandle encoder(TONEWRIGHT_CreateAudioEncoder(makeSource(script).get(), wrap(format).get()));
        ASSERT_TRUE(encoder);
        int calls = 0;
        const auto target = behind<tonewright::IEncoderProgressTarget>(encoder);
        target->setProgressFunction([&, target = target.get()](double fraction) {
            ++calls;
            if (fraction >= c.discardsAt) target->stopAndDiscard();
            return fraction < c.stopsAt;
        });
        EXPECT_EQ(TONEWRIGHT_AudioEncoder_SetCallback(encoder.get(), throwInt), 0);
        EXPECT_EQ(TONEWRIGHT_AudioEncoder_SetCallback(encoder.get(), c.callback), 0);
        g_calls = 0;
        EXPECT_EQ(TONEWRIGHT_AudioEncoder_Encode(encoder.get()), c.result);
        EXPECT_EQ(format->bytes / 4, c.frames);
        EXPECT_EQ(format->isDiscarded, c.result != 0 || c.discardsAt <= 1.0) << "a failed job has no result";
        if (c.callback == goOn) {
            EXPECT_EQ(g_calls, calls) << "both are called";
        }
        EXPECT_TRUE(c.result != 0 || !format->isOpened());
    }
}

TEST_F(Exports, EncoderCallback_MayChangeAndTheHandleGoWhileTheJobRuns) {
    SFakeSource script;
    script.frames = 4608 * 400;
    std::atomic<bool> running{false};
    script.onRead = [&] { running = true; };
    CHandle source = makeSource(script), format = wrap(peru::make<CFakeFormat>());
    TONEWRIGHT_Handle encoder = TONEWRIGHT_CreateAudioEncoder(source.get(), format.get());
    ASSERT_TRUE(encoder);
    std::atomic<bool> done{false};
    std::thread job([&] {
        EXPECT_EQ(TONEWRIGHT_AudioEncoder_Encode(encoder), 0);
        done = true;
    });
    while (!running && !done) std::this_thread::yield();
    for (int i = 0; i < 1000; ++i) TONEWRIGHT_AudioEncoder_SetCallback(encoder, i % 2 ? goOn : nullptr);
    TONEWRIGHT_DestroyHandle(encoder);
    job.join();
}

TEST_F(Exports, Threads_MakeAndUseSourcesAtTheSameTime) {
    CHandle shared(TONEWRIGHT_CreateAudioSourceFromURI(u"file:///shared.tst", 8000, 1, 2, 0));
    ASSERT_TRUE(shared);
    std::vector<std::thread> threads;
    for (int t = 0; t < 8; ++t)
        threads.emplace_back([&shared] {
            for (int i = 0; i < 50; ++i) {
                CHandle source(TONEWRIGHT_CreateAudioSourceFromURI(u"file:///a.tst", 8000, 1, 2, i % 2));
                EXPECT_TRUE(source);
                EXPECT_EQ(TONEWRIGHT_AudioSource_Open(source.get()), 0);
                EXPECT_EQ(TONEWRIGHT_AudioSource_GetDuration(source.get()), 1.0);
                EXPECT_EQ(TONEWRIGHT_AudioSource_Open(shared.get()), 0);
                EXPECT_EQ(TONEWRIGHT_AudioSource_Close(shared.get()), 0);
                EXPECT_EQ(TONEWRIGHT_AudioSource_Close(source.get()), 0);
                EXPECT_FALSE(TONEWRIGHT_CreateAudioSourceFromURI(u"file:///refuse.tst", 8000, 1, 2, 0));
                TONEWRIGHT_DestroyHandle(TONEWRIGHT_getValidCodecExtensions(2));
            }
        });
    for (std::thread& thread : threads) thread.join();
}

} // namespace
