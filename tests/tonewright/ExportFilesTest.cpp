// Exports with the real plug-ins: effects on the user's files, and reasons of failures.
#include "Library.h"
#include "sonora2/context/LastFailure.h"
#include "sonora2/plugins/MediaEnvironment.h"
#include "support/Files.h"
#include "tonewright/ICallbackTargets.h"

#include <gmock/gmock.h>

#include <set>

namespace {

using namespace tests;
namespace fs = std::filesystem;

class ExportReasons : public testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK); }
    void TearDown() override { TONEWRIGHT_DeInitAll(); }

    static CHandle makeFormat(const fs::path& path, int32_t rate = 44100, int32_t bitRate = 0) {
        return CHandle(TONEWRIGHT_CreateAudioFormatFromURI(uriOf(path).c_str(), rate, 2, 2, 0.0, bitRate,
                                                           bitRate, bitRate));
    }
    // Ten seconds long; optionally fails half-way.
    static CHandle makeSource(bool fails = false) {
        auto position = std::make_shared<int>(0);
        SFakeSource script{.rate = 44100, .frames = 441000, .chunkFrames = 4410};
        script.onRead = [position, fails] {
            if (++*position > 50 && fails) throw std::runtime_error("scratched");
        };
        return wrap(peru::make<CFakeSource>(script));
    }
    // Calls `during` once in the middle; it may stop the encoder.
    using During = std::function<bool(tonewright::IEncoderProgressTarget&)>;
    static int32_t encode(const CHandle& source, const CHandle& format, const During& during = {}) {
        const CHandle encoder(TONEWRIGHT_CreateAudioEncoder(source.get(), format.get()));
        const auto target = behind<tonewright::IEncoderProgressTarget>(encoder);
        bool isDone = !during;
        target->setProgressFunction([&](double fraction) {
            if (isDone || fraction < 0.4) return true;
            isDone = true;
            return during(*target);
        });
        return TONEWRIGHT_AudioEncoder_Encode(encoder.get());
    }
    std::vector<std::string> list() const {
        std::vector<std::string> names;
        for (const auto& entry : fs::directory_iterator(folder.path()))
            names.push_back(entry.path().filename());
        std::sort(names.begin(), names.end());
        return names;
    }
    // Seconds of sound in a file; negative if it is none.
    static double getDuration(const fs::path& path) {
        return TONEWRIGHT_AudioSource_GetDuration(
            CHandle(TONEWRIGHT_CreateAudioSourceFromURI(uriOf(path).c_str(), 44100, 2, 2, 0)).get());
    }

    CTempFolder folder;
};

class ExportFiles : public ExportReasons, public testing::WithParamInterface<const char*> {
protected:
    const std::string name = std::string("x.") + GetParam();
    const fs::path target = folder / name;
};

TEST_P(ExportFiles, ExistingTarget_IsReplacedOnlyByAResult) {
    enum EEnd { kWhole, kStopped, kDiscarded, kFailed };
    for (const EEnd end : {kWhole, kStopped, kDiscarded, kFailed})
        for (const bool exists : {true, false}) {
            SCOPED_TRACE(testing::Message() << GetParam() << " " << end << " " << exists);
            fs::remove(target);
            if (exists) {
                folder.write(name, "dear to somebody");
                fs::permissions(target, fs::perms(0600));
            }
            const auto during = [&](tonewright::IEncoderProgressTarget& job) {
                EXPECT_EQ(list(), std::vector{name}) << "a process that is killed leaves nothing else";
                if (exists) {
                    EXPECT_EQ(readFile(target), "dear to somebody");
                }
                if (end == kDiscarded) job.stopAndDiscard();
                return end != kStopped;
            };
            EXPECT_EQ(encode(makeSource(end == kFailed), makeFormat(target), during),
                      end == kFailed ? 11 : 0);
            if (end == kWhole || end == kStopped) {
                EXPECT_NEAR(getDuration(target), end == kWhole ? 10.0 : 4.0, 0.2);
                EXPECT_EQ(fs::status(target).permissions() == fs::perms(0600), exists);
            } else if (exists) {
                EXPECT_EQ(readFile(target), "dear to somebody");
            }
            EXPECT_EQ(list().size(), exists || end < kDiscarded ? 1u : 0u);
        }
}

TEST_P(ExportFiles, SourceAsTarget_IsRefusedUnderEveryName) {
    ASSERT_EQ(encode(makeSource(), makeFormat(target)), 0);
    const std::string before = readFile(target);
    const fs::path hard = folder / ("hard." + std::string(GetParam())),
                   soft = folder / ("soft." + std::string(GetParam()));
    fs::create_hard_link(target, hard);
    fs::create_symlink(target.filename(), soft);
    for (const fs::path& path : {target, fs::path(folder.path() / "." / name), hard, soft}) {
        const CHandle source(TONEWRIGHT_CreateAudioSourceFromURI(uriOf(target).c_str(), 44100, 2, 2, 0));
        EXPECT_EQ(encode(source, makeFormat(path)), 11) << path;
        EXPECT_TRUE(readFile(target) == before);
    }
    EXPECT_TRUE(fs::is_symlink(soft));
}

TEST_P(ExportFiles, JobsOfOneTarget_EachFinishAsAWhole) {
    const fs::path link = folder / ("link." + std::string(GetParam()));
    fs::create_symlink(target.filename(), link); // leads nowhere at first
    for (int round = 0; round < 2; ++round) {
        const auto during = [&](auto&) {
            EXPECT_EQ(encode(makeSource(), makeFormat(target), [](auto&) { return false; }), 0);
            EXPECT_NEAR(getDuration(target), 4.0, 0.2);
            return true;
        };
        EXPECT_EQ(encode(makeSource(), makeFormat(link), during), 0);
        EXPECT_NEAR(getDuration(target), round == 0 ? 4.0 : 10.0, 0.2);
        EXPECT_EQ(list().size(), 2u);
    }
    // A file that has taken the place of the new one is not removed with it.
    fs::remove(target);
    const auto during = [&](tonewright::IEncoderProgressTarget& job) {
        fs::rename(target, folder / "elsewhere");
        folder.write(name, "dear to somebody");
        job.stopAndDiscard();
        return true;
    };
    EXPECT_EQ(encode(makeSource(), makeFormat(target), during), 0);
    EXPECT_EQ(readFile(target), "dear to somebody");
}

TEST_P(ExportFiles, FormatThatDoesNotFit_LeavesNothing) {
    EXPECT_EQ(encode(makeSource(), makeFormat(target, 48000)), 11) << "it would play at another speed";
    if (std::string(GetParam()) == "ogg") {
        EXPECT_EQ(TONEWRIGHT_AudioFormat_Open(makeFormat(target, 44100, 1).get()), 5) << "one bit per second";
    }
    EXPECT_TRUE(list().empty());
}

TEST_F(ExportReasons, StartUp_PreparesBothSides) {
    const auto list = [](int32_t types) {
        const CHandle extensions(TONEWRIGHT_getValidCodecExtensions(types));
        std::set<std::u16string> names;
        for (int32_t i = 0; i < TONEWRIGHT_getExtensionCount(extensions.get()); ++i)
            names.insert(TONEWRIGHT_GetText(CHandle(TONEWRIGHT_getExtension(extensions.get(), i)).get()));
        return names;
    };
    EXPECT_EQ(list(TONEWRIGHT_AUDIO_FORMAT).count(u"mp3"), 1u);
    EXPECT_EQ(list(TONEWRIGHT_AUDIO_FORMAT).count(u"mp2"), 0u) << "read, but not written";
    EXPECT_EQ(list(TONEWRIGHT_AUDIO_SOURCE).count(u"mp2"), 1u);
    EXPECT_EQ(list(TONEWRIGHT_IMAGE | TONEWRIGHT_AUDIO_FORMAT).size(), 4u);
    // Plug-ins decide by the flag words, which a host cannot see.
    const auto environment = sonora2::common::getMediaEnvironment();
    EXPECT_EQ(environment.readContext->getFlags(), 0x23E8u);
    EXPECT_EQ(environment.writeContext->getFlags(), 0x3C8u);
    for (const auto& context : {environment.readContext, environment.writeContext})
        EXPECT_THAT(text(context->getBaseDirectories()->getDataDirectory()->getAsString()),
                    testing::EndsWith("/Zelvanor%20Tonewright%204/"));
}

// The framework counts severities down, the program's log up.
TEST_F(ExportReasons, FrameworkMessages_ReachTheHostsLog) {
    const CHostLog log;
    const auto framework = sonora2::common::getMediaEnvironment().writeContext->getLogManager();
    const int32_t levels[] = {5, 3, 2, 1, 0, 2};
    for (int32_t severity = 0; severity < 6; ++severity) {
        framework->log(severity, peru::CString::fromUTF8("x"));
        EXPECT_THAT(log.take(), testing::ElementsAre(SLine{levels[severity], "", "x"})) << severity;
    }
    framework->logException(peru::CError("broken"));
    EXPECT_THAT(log.take(), testing::ElementsAre(SLine{5, "", "Exception: Error Type: broken"}));
}

// What a host shows its user.
TEST_F(ExportReasons, FailedCalls_SayWhatIsWrong) {
    const CHostLog log;
    SFakeSource script{.rate = 44100, .channels = 8};
    ASSERT_EQ(encode(wrap(peru::make<CFakeSource>(script)),
                     CHandle(TONEWRIGHT_CreateAudioFormatFromURI(uriOf(folder / "eight.wav").c_str(), 44100,
                                                                 8, 2, 0.0, 0, 0, 0))),
              0);
    TONEWRIGHT_SetTempExtension(u".part");
    struct SCase {
        std::string name;
        bool isRead;
        int32_t rate;
        std::string reason; // its end
    };
    for (const SCase& c : std::initializer_list<SCase>{
             {"a.xyz", true, 44100, "No plug-in reads .xyz files"},
             {"a.xyz", false, 44100, "No plug-in writes .xyz files"},
             {"name", true, 44100, "No plug-in reads files without an extension"},
             {"eight.wav", true, 44100,
              "eight.wav has 8 channels and cannot be converted to 44100 Hz, 2 channels"},
             {"missing.flac", true, 44100, "missing.flac: No such file or directory"},
             {"a.mp3.part", false, 96000,
              "MP3 files hold 1 or 2 channels at 8, 11.025, 12, 16, 22.05, 24, 32, 44.1 or 48 kHz, not 2 "
              "channels at 96000 Hz"},
         }) {
        log.take();
        const std::u16string uri = uriOf(folder / c.name);
        EXPECT_FALSE(c.isRead ? CHandle(TONEWRIGHT_CreateAudioSourceFromURI(uri.c_str(), c.rate, 2, 2, 0))
                              : makeFormat(folder / c.name, c.rate));
        EXPECT_THAT(log.take(), testing::Contains(testing::AllOf(
                                    testing::Field(&SLine::level, 5),
                                    testing::Field(&SLine::text, testing::EndsWith(c.reason)))))
            << c.reason;
        const sonora2::common::SFailure failure = sonora2::common::getLastFailure();
        EXPECT_THAT(failure.message, testing::EndsWith(c.reason));
        EXPECT_THAT(failure.uri, testing::EndsWith(c.name));
        EXPECT_NE(failure.kind, "");
    }
}

INSTANTIATE_TEST_SUITE_P(Formats, ExportFiles, testing::Values("wav", "flac", "ogg", "mp3"),
                         [](const auto& made) { return std::string(made.param); });

} // namespace
