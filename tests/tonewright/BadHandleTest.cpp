#include "Library.h"
#include "support/Environment.h"

#include <algorithm>
#include <csignal>
#include <functional>
#include <sstream>
#include <unistd.h>

namespace {

using namespace tests;

struct SCase {
    const char* name;
    std::function<double(TONEWRIGHT_Handle)> call; // results as numbers, null handles as 0
    double expected;
};

double number(TONEWRIGHT_Handle handle) {
    const bool isNull = handle == nullptr;
    TONEWRIGHT_DestroyHandle(handle);
    return isNull ? 0 : 1;
}

bool never(TONEWRIGHT_Handle, double, const float*, int32_t, void*) {
    ADD_FAILURE() << "called back";
    return true;
}

#define CALL(expression) [](TONEWRIGHT_Handle h) { return static_cast<double>(expression); }
#define VOID(expression)                                                                                     \
    [](TONEWRIGHT_Handle h) {                                                                                \
        expression;                                                                                          \
        return 0.0;                                                                                          \
    }

const SCase kCases[] = {
    {"AddProxyLogManager", VOID(TONEWRIGHT_AddProxyLogManager(h)), 0},
    {"RemoveProxyLogManager", VOID(TONEWRIGHT_RemoveProxyLogManager(h)), 0},
    {"getExtensionCount", CALL(TONEWRIGHT_getExtensionCount(h)), 0},
    {"getExtension", CALL(number(TONEWRIGHT_getExtension(h, 0))), 0},
    {"FromAudioInDevice", CALL(number(TONEWRIGHT_CreateAudioSoureFromAudioInDevice(h, 44100, 2, 2))), 0},
    {"AudioSource_IsOpened", CALL(TONEWRIGHT_AudioSource_IsOpened(h)), 0},
    {"AudioSource_Open", CALL(TONEWRIGHT_AudioSource_Open(h)), 3},
    {"AudioSource_Close", CALL(TONEWRIGHT_AudioSource_Close(h)), 3},
    {"AudioSource_GetDuration", CALL(TONEWRIGHT_AudioSource_GetDuration(h)), -1},
    {"SetRecordingCallback", VOID(TONEWRIGHT_AudioSource_SetRecordingCallback(h, nullptr)), 0},
    {"SetRecordingVolumeCallback", VOID(TONEWRIGHT_AudioSource_SetRecordingVolumeCallback(h, nullptr)), 0},
    {"FetchStreamSamples", CALL(TONEWRIGHT_AudioSource_FetchStreamSamples(h, never, 0.01, nullptr)), 0},
    {"AudioFormat_IsOpened", CALL(TONEWRIGHT_AudioFormat_IsOpened(h)), 0},
    {"AudioFormat_Open", CALL(TONEWRIGHT_AudioFormat_Open(h)), 5},
    {"AudioFormat_Close", CALL(TONEWRIGHT_AudioFormat_Close(h)), 3},
    {"GetEstiamtedFileSize", CALL(TONEWRIGHT_AudioFormat_GetEstiamtedFileSize(h, 1.0)), -1},
    {"CreateAudioEncoder", CALL(number(TONEWRIGHT_CreateAudioEncoder(h, h))), 0},
    {"AudioEncoder_Encode", CALL(TONEWRIGHT_AudioEncoder_Encode(h)), 10},
    {"AudioEncoder_SetCallback", CALL(TONEWRIGHT_AudioEncoder_SetCallback(h, nullptr)), 10},
    {"CreatePlayer", CALL(number(TONEWRIGHT_CreatePlayerFromAudioSource(h))), 0},
    {"Player_Play", CALL(TONEWRIGHT_Player_Play(h)), 9},
    {"Player_Pause", CALL(TONEWRIGHT_Player_Pause(h)), 9},
    {"Player_Stop", CALL(TONEWRIGHT_Player_Stop(h)), 9},
    {"Player_SetCallback", CALL(TONEWRIGHT_Player_SetCallback(h, nullptr)), 9},
    {"StoreFileTag", CALL(TONEWRIGHT_StoreFileTag(h)), 8},
    {"FileTag_GetArtist", CALL(number(TONEWRIGHT_FileTag_GetArtist(h))), 0},
    {"FileTag_GetYear", CALL(number(TONEWRIGHT_FileTag_GetYear(h))), 0},
    {"FileTag_SetTitle", VOID(TONEWRIGHT_FileTag_SetTitle(h, u"x")), 0},
    {"AddTrack", CALL(TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(h, h, 0)), 4},
    {"AddFile", CALL(TONEWRIGHT_DataDiscProject_AddFileFromAudioSource(h, u"/a", u"file:///a")), 7},
    {"Normalize", CALL(TONEWRIGHT_INORMALIZE_processAudioSource(h, -3.0, nullptr)), 3},
};

void expectAllRefuse(TONEWRIGHT_Handle handle, const char* kind) {
    for (const SCase& c : kCases) EXPECT_EQ(c.call(handle), c.expected) << c.name << " on " << kind;
}

class BadHandle : public CLibraryTest {};

TEST_F(BadHandle, NullAndOtherKinds_GiveTheFamilysValue) {
    expectAllRefuse(nullptr, "null");
    expectAllRefuse(wrap(nullptr).get(), "a wrapper of nothing");
    expectAllRefuse(wrap(peru::CString::fromUTF8("x")).get(), "another object");
    CHandle text(reinterpret_cast<TONEWRIGHT_Handle>(
        static_cast<peru::IInstanceWrapper*>(new peru::CStringInstanceWrapper(u"x"))));
    expectAllRefuse(text.get(), "a text");
}

// Calls everything that needs the started library with otherwise valid arguments.
void expectNotStarted() {
    CHandle source = wrap(peru::make<CFakeSource>(SFakeSource()));
    CHandle format = wrap(peru::make<CFakeFormat>());
    expectAllRefuse(nullptr, "null, not started");
    EXPECT_EQ(TONEWRIGHT_InitGui(u"", u"", u"", 0, u"/x", u""), 1);
    EXPECT_FALSE(TONEWRIGHT_CreateAudioSourceFromURI(u"file:///a.tst", 44100, 2, 2, 0));
    EXPECT_FALSE(TONEWRIGHT_CreateAudioFormatFromURI(u"file:///a.tst", 44100, 2, 2, 0, 0, 0, 0));
    EXPECT_FALSE(TONEWRIGHT_CreateAudioEncoder(source.get(), format.get()));
    EXPECT_EQ(TONEWRIGHT_AudioSource_Open(source.get()), 3);
    EXPECT_EQ(TONEWRIGHT_AudioSource_GetDuration(source.get()), -1.0);
    EXPECT_EQ(TONEWRIGHT_AudioSource_FetchStreamSamples(source.get(), never, 0.01, nullptr), 0);
    EXPECT_FALSE(TONEWRIGHT_getValidCodecExtensions(2));
    EXPECT_FALSE(TONEWRIGHT_CreatePlayerFromURI(u"file:///a.tst"));
    EXPECT_FALSE(TONEWRIGHT_CreatePlayerFromAudioSource(source.get()));
    TONEWRIGHT_SetTempExtension(u".part");
    TONEWRIGHT_SetDriveChangedCallback(nullptr);
    TONEWRIGHT_SetLanguageID(u"de-AT");
}

TEST(Start, Startup_TellsItselfAndEachPluginThatFailsInOrder) {
    CTempFolder folder;
    const std::vector<std::string> readers{"flac", "decmpa", "vorbis", "wav", "wmf", "dsgraph", "discio"};
    const std::vector<std::string> writers{"flac", "l3codec", "vorbis", "wav", "wmf"};
    std::vector<SLine> expected{{2, "tonewright_shared", "TONEWRIGHT_InitStartup"}};
    for (const auto* names : {&readers, &writers})
        for (const std::string& name : *names) {
            const std::string file = "sonora2_" + name + ".so";
            folder.write(file, "this is no library");
            expected.push_back({3, "", "Error while loading DLL: Error - could not load plugin: " + file});
        }
    CEnvironment path("TONEWRIGHT_PLUGIN_PATH", folder.path().string());
    CHostLog log;
    EXPECT_EQ(TONEWRIGHT_InitStartup(), 0);
    std::vector<SLine> lines = log.take();
    std::erase_if(lines, [](const SLine& line) { return line.level < 2; }); // the loader's own reasons
    EXPECT_EQ(lines, expected);
    TONEWRIGHT_DeInitAll();
}

TEST(Start, Startup_ThatFailsLateLeavesWhatItHadUntilTheEnd) {
    CPluginFolder plugins;
    CTempFolder folder;
    const std::string companion = folder.write("CancelAutoplay2", "no program").string();
    {
        CEnvironment path("TONEWRIGHT_COMPANION_PATH", folder.path().string());
        CHostLog log;
        EXPECT_EQ(TONEWRIGHT_InitStartup(), 1);
        EXPECT_EQ(log.take().back(),
                  (SLine{5, "", "CCancelAutoplay2: failed to execute \"" + companion + "\""}));
    }
    EXPECT_TRUE(CHandle(TONEWRIGHT_CreateAudioSourceFromURI(u"file:///a.tst", 44100, 2, 2, 0)));
    TONEWRIGHT_DeInitAll();
    EXPECT_FALSE(TONEWRIGHT_CreateAudioSourceFromURI(u"file:///a.tst", 44100, 2, 2, 0));
    EXPECT_EQ(TONEWRIGHT_InitStartup(), 0);
    TONEWRIGHT_DeInitAll();
}

TEST(Start, Canceller_GetsTheProcessAndEndsWithTheLibrary) {
    CPluginFolder plugins;
    CTempFolder folder;
    const auto script = folder.write("CancelAutoplay2", "#!/bin/sh\n"
                                                        "echo $$ \"$@\" > \"${0%/*}/new\"\n"
                                                        "mv \"${0%/*}/new\" \"${0%/*}/told\"\n"
                                                        "exec sleep 100\n");
    std::filesystem::permissions(script, std::filesystem::perms(0700));
    const CEnvironment path("TONEWRIGHT_COMPANION_PATH", folder.path().string());
    ASSERT_EQ(TONEWRIGHT_InitStartup(), 0);
    while (!std::filesystem::exists(folder / "told")) usleep(1000);
    int child = 0;
    std::istringstream told(readFile(folder / "told"));
    std::string arguments;
    std::getline(told >> child >> std::ws, arguments);
    EXPECT_EQ(arguments, std::to_string(getpid()) + " dummy");
    EXPECT_EQ(kill(child, 0), 0);
    TONEWRIGHT_DeInitAll();
    EXPECT_NE(kill(child, 0), 0);
}

TEST(Start, End_ReleasesALogThatCameBeforeTheStart) {
    class CMortalLog : public CLines {
    public:
        explicit CMortalLog(bool& isAlive) : m_isAlive(isAlive) { m_isAlive = true; }
        ~CMortalLog() override { m_isAlive = false; }

    private:
        bool& m_isAlive;
    };
    bool isAlive = false;
    {
        P<peru::CLogManager> manager = peru::make<peru::CLogManager>();
        manager->addLog(peru::make<CMortalLog>(isAlive), peru::CString::empty());
        TONEWRIGHT_AddProxyLogManager(wrap(manager).get());
    }
    EXPECT_TRUE(isAlive);
    TONEWRIGHT_DeInitAll();
    EXPECT_FALSE(isAlive);
}

TEST(Start, Functions_FailOutsideOfStartAndEnd) {
    CPluginFolder plugins;
    expectNotStarted();
    TONEWRIGHT_DeInitAll();
    for (int round = 0; round < 3; ++round) {
        ASSERT_EQ(TONEWRIGHT_InitStartup(), 0);
        EXPECT_EQ(TONEWRIGHT_InitStartup(), 0) << "a second start changes nothing";
        EXPECT_TRUE(CHandle(TONEWRIGHT_CreateAudioSourceFromURI(u"file:///a.tst", 44100, 2, 2, 0)));
        EXPECT_EQ(TONEWRIGHT_InitGui(u"", nullptr, u"", 1, u"/x", u""), 0);
        TONEWRIGHT_DeInitAll();
        expectNotStarted();
        TONEWRIGHT_DeInitAll();
    }
}

} // namespace
