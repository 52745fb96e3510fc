#include "sonora2/plugins/PluginHandler.h"

#include "sonora2/context/LastFailure.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/context/SonoraError.h"
#include "support/Environment.h"
#include "support/FakeMedia.h"
#include "support/Files.h"
#include "support/LogLines.h"
#include "support/TempFolder.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

namespace {

using namespace sonora2::common;
using namespace tests;
using peru::CString;
using peru::IString;
using peru::IURI;
using peru::make;
using peru::P;
using testing::ElementsAre;
using testing::IsEmpty;

P<IURI> uri(const std::string& text) {
    return make<peru::CURI>(CString::fromUTF8(text));
}

// Its handlers start without plug-ins: the context names one library that does not exist.
class PluginHandler : public testing::Test {
protected:
    PluginHandler() {
        context->setLogManager(log);
        context->addPluginName("testplugin_nowhere");
    }

    P<CPluginHandler> makeHandler(const P<IPluginPreference>& preference = nullptr) {
        P<CPluginHandler> handler = make<CPluginHandler>(context, false, "", preference);
        log->lines.clear();
        return handler;
    }
    static P<CFakePlugin> addPlugin(CPluginHandler& handler, const char* name,
                                    std::initializer_list<const char*> extensions) {
        P<CFakePlugin> plugin = make<CFakePlugin>(name, extensions);
        plugin->makeSource = [](const P<IURI>& u, const ISonoraPlugin::SSourceParams&) {
            return make<CFakeSource>(SFakeSource(), u);
        };
        handler.addPlugin(plugin, plugin);
        return plugin;
    }
    static P<IAudioSource> open(CPluginHandler& handler, const std::string& name, bool keepOpened = false) {
        return handler.createAudioSource(uri("file:///x/" + name), 44100, 2, 2, keepOpened);
    }

    P<CLogLines> log = make<CLogLines>();
    P<ISonoraContext> context = make<sonora2::audio::CSonoraContextAudio>();
};

TEST_F(PluginHandler, FailingCandidates_AreLoggedAndTheNextOneGetsItsTurn) {
    P<CPluginHandler> handler = makeHandler();
    addPlugin(*handler, "other", {"wav"});
    addPlugin(*handler, "declining", {"tst"})->makeSource = [](auto&&...) { return nullptr; };
    auto addFailing = [&](const char* name, std::function<void()> onOpen) {
        addPlugin(*handler, name, {"tst"})->makeSource = [onOpen](auto&&...) {
            SFakeSource script;
            script.onOpen = onOpen;
            return make<CFakeSource>(script);
        };
    };
    addFailing("throwing", [] { throw CSonoraError("broken header"); });
    addFailing("odd", [] { throw 42; });
    addFailing("foreign", [] { throw std::runtime_error("of another library"); });
    addPlugin(*handler, "closed", {"tst"})->makeSource = [](auto&&...) {
        SFakeSource script;
        script.staysClosed = true;
        return make<CFakeSource>(script);
    };
    P<CFakePlugin> good = addPlugin(*handler, "good", {"abc", "TST"});
    P<CFakePlugin> late = addPlugin(*handler, "late", {"tst"});

    P<IAudioSource> source = open(*handler, "a%20b.Tst");
    ASSERT_TRUE(source);
    EXPECT_FALSE(source->isOpened());
    EXPECT_EQ(good->sourceCalls, 1);
    EXPECT_EQ(good->mask, 2);
    EXPECT_EQ(late->sourceCalls, 0);
    EXPECT_THAT(
        log->lines,
        ElementsAre("tried to open file:///x/a%20b.Tst with plugin throwing.\nOpening failed: Error - "
                    "broken header",
                    "tried to open file:///x/a%20b.Tst with plugin odd.\nOpening failed: unknown "
                    "exception",
                    "tried to open file:///x/a%20b.Tst with plugin foreign.\nOpening failed: unknown "
                    "exception"));
    source.reset();
    EXPECT_EQ(CFakeSource::s_alive, 0) << "failed candidates are released";
}

TEST_F(PluginHandler, LookupKey_IsTheExtensionWithoutSuffixAndPoint) {
    P<CPluginHandler> handler = makeHandler();
    addPlugin(*handler, "p", {"tst"});
    const std::tuple<const char*, const char*, bool> cases[] = {
        {"", "a.TST", true},        {"", "a.b.tst", true},         {"", "a", false},
        {"", "a.", false},          {"", ".tst", false},           {"", "tst", false},
        {"", "a.tstx", false},      {".part", "a.tst.PART", true}, {".part", "a.tst", true},
        {".part", "a.part", false}, {"_x", "a._xtst", false},      {" (1)", "a.tst%20(1)", true},
        {"a.tst", "a.tst", false},
    };
    for (const auto& [suffix, name, found] : cases) {
        handler->setURISuffix(suffix);
        EXPECT_EQ(static_cast<bool>(open(*handler, name)), found) << name << " with " << suffix;
    }
}

TEST_F(PluginHandler, AcceptanceTest_LeavesTheSourceAsWanted) {
    const std::tuple<bool, bool, bool, int> cases[] = {
        {true, true, true, 1}, {true, false, false, 1}, {false, true, false, 0}, {false, false, false, 0}};
    for (const auto& [verify, keepOpened, opened, opens] : cases) {
        P<CPluginHandler> handler = makeHandler();
        addPlugin(*handler, "p", {"tst"});
        handler->setVerifyByOpening(verify);
        P<CFakeSource> source(open(*handler, "a.tst", keepOpened));
        ASSERT_TRUE(source);
        EXPECT_EQ(source->isOpened(), opened) << verify << keepOpened;
        EXPECT_EQ(source->opens, opens) << verify << keepOpened;
        EXPECT_EQ(handler->getVerifyByOpening(), verify);
        // By the plug-in itself.
        addPlugin(*handler, "opening", {"opn"})->makeSource = [](auto&&...) {
            const auto made = make<CFakeSource>(SFakeSource());
            made->open();
            return made;
        };
        EXPECT_EQ(open(*handler, "a.opn", keepOpened)->isOpened(), opened);
    }
}

// A plug-in that declines gives no reason, unlike the file's own format.
TEST_F(PluginHandler, Refusal_IsExplainedByTheOwnFormat) {
    SFakeSource own{.channels = 1};
    P<CPluginHandler> handler = makeHandler();
    P<CFakePlugin> plugin = addPlugin(*handler, "p", {"tst"});
    plugin->makeSource = [&](const P<IURI>&, const ISonoraPlugin::SSourceParams& params) -> P<ISource> {
        return params.nSampleRate > 0 ? nullptr : make<CFakeSource>(own);
    };
    plugin->makeFormat = [](auto&&...) { return nullptr; };
    const auto explain = [&] {
        clearLastFailure();
        handler->setURISuffix(".part");
        EXPECT_FALSE(open(*handler, "a%20b.tst.part"));
        EXPECT_EQ(getLastFailure().uri, "file:///x/a%20b.tst.part");
        EXPECT_EQ(CFakeSource::s_alive, 0);
        return getLastFailure().message;
    };
    EXPECT_EQ(explain(), "a b.tst (1000 Hz, 1 channels, 2 bytes per sample) cannot be converted to 44100 Hz, "
                         "2 channels, 2 bytes per sample");
    own.channels = 5;
    EXPECT_EQ(explain(), "a b.tst has 5 channels, which cannot be converted to 2");
    own.onOpen = [] { throw CSonoraError("broken header"); };
    EXPECT_EQ(explain(), "a b.tst: broken header");
    own.onOpen = [] { throw 42; };
    EXPECT_EQ(explain(), "a b.tst cannot be read as 44100 Hz, 2 channels, 2 bytes per sample");
    EXPECT_FALSE(handler->createAudioFormat(uri("file:///a.tst"), 48000, 1, 3));
    EXPECT_EQ(getLastFailure().message,
              "No plug-in writes a.tst with 48000 Hz, 1 channels, 3 bytes per sample");
    EXPECT_FALSE(handler->createVideoFormat(uri("file:///a.tst"), nullptr));
    EXPECT_EQ(plugin->mask, 8);
}

TEST_F(PluginHandler, ParameterRecord_IsTakenByItsSizeAndMustBeComplete) {
    P<CPluginHandler> handler = makeHandler();
    P<CFakePlugin> plugin = addPlugin(*handler, "p", {"tst"});
    ISonoraPlugin::SSourceParams seen;
    plugin->makeSource = [&](const P<IURI>&, const ISonoraPlugin::SSourceParams& params) {
        seen = params;
        return make<CFakeSource>(SFakeSource());
    };
    ISonoraPlugin::SSourceParams params;
    params.nSampleRate = 8000;
    params.nChannelCount = 1;
    params.nBytesPerSample = 2;
    const P<IURI> file = uri("file:///a.tst");

    params.nSize = 1000; // a later caller's longer record
    EXPECT_TRUE(handler->createAudioSource(file, &params));
    EXPECT_EQ(seen.nSize, 20);
    EXPECT_EQ(seen.nSampleRate, 8000);

    params.nSize = 16; // ends before the bytes per sample
    auto expectRefused = [&](auto create) {
        EXPECT_EQ(errorOf<CSonoraError>(create),
                  "not all sourceparameter fields are valid for creating an audio source");
    };
    expectRefused([&] { handler->createAudioSource(file, &params); });
    expectRefused([&] { handler->createSource(file, nullptr); });
    expectRefused([&] { handler->createAudioSource(file, 44100, 0, 2, false); });
    EXPECT_FALSE(handler->createVideoSource(file, nullptr)) << "needs no numbers, but is no video";
    EXPECT_TRUE(open(*handler, "a.tst")) << "the lock is free again";
}

class CPreference : public peru::CObject, public IPluginPreference {
public:
    P<IString> lookUp(int, const P<IURI>&) override {
        if (name == "throw") throw peru::CError("no memory");
        if (name == "throw oddly") throw 42;
        return CString::fromUTF8(name);
    }
    void store(int mask, const P<IURI>& u, const P<IString>& plugin) override {
        stored.push_back(std::to_string(mask) + " " + CString::toStdString(u->getAsString()) + " " +
                         CString::toStdString(plugin));
    }
    std::string name;
    std::vector<std::string> stored;
};

TEST_F(PluginHandler, Preference_ComesFirstWhateverTheExtension) {
    P<CPreference> preference = make<CPreference>();
    P<CPluginHandler> handler = makeHandler(preference);
    P<CFakePlugin> first = addPlugin(*handler, "first", {"tst"});
    P<CFakePlugin> second = addPlugin(*handler, "second", {"xyz"});

    preference->name = "second";
    EXPECT_TRUE(open(*handler, "a.tst"));
    EXPECT_TRUE(open(*handler, "noextension"));
    EXPECT_EQ(first->sourceCalls, 0);
    EXPECT_EQ(second->sourceCalls, 2);
    EXPECT_THAT(preference->stored, IsEmpty());

    second->makeSource = [](auto&&...) -> P<ISource> { throw CSonoraError("moved"); };
    for (const char* name : {"second", "unknown", "", "throw", "throw oddly"}) {
        preference->name = name;
        preference->stored.clear();
        EXPECT_TRUE(open(*handler, "a.tst")) << name;
        EXPECT_THAT(preference->stored, ElementsAre("2 file:///x/a.tst first")) << name;
    }
}

TEST_F(PluginHandler, Formats_AreAcceptedUnopened) {
    P<CPluginHandler> handler = makeHandler();
    addPlugin(*handler, "broken", {"tst"})->makeFormat = [](auto&&...) -> P<IFormat> {
        throw CSonoraError("no encoder");
    };
    P<CFakePlugin> plugin = addPlugin(*handler, "p", {"tst"});
    plugin->makeFormat = [](const P<IURI>&, const ISonoraPlugin::SFormatParams& params) {
        return make<CFakeFormat>(params);
    };
    P<CFakeFormat> format(handler->createAudioFormat(uri("file:///a.tst"), 48000, 1, 3));
    ASSERT_TRUE(format);
    EXPECT_FALSE(format->isOpened());
    EXPECT_EQ(plugin->mask, 16);
    EXPECT_EQ(format->params.nSize, 116);
    EXPECT_EQ(format->params.nBytesPerSample, 3);
    EXPECT_THAT(log->lines, ElementsAre("tried to create file:///a.tst with plugin broken.\nOpening failed: "
                                        "Error - no encoder"));
    EXPECT_TRUE(handler->createFormat(uri("file:///a.tst"), nullptr));
    EXPECT_EQ(plugin->mask, 24);
    EXPECT_TRUE(handler->createObject(uri("file:///a.tst"), nullptr));
}

TEST_F(PluginHandler, CreateCalls_AreSerialised) {
    P<CPluginHandler> handler = makeHandler();
    std::atomic<int> inside{0};
    std::atomic<bool> overlapped{false};
    addPlugin(*handler, "p", {"tst"})->makeSource = [&](auto&&...) {
        SFakeSource script;
        script.onOpen = [&] {
            if (++inside > 1) overlapped = true;
            std::this_thread::yield();
            --inside;
        };
        return make<CFakeSource>(script);
    };
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back([&] {
            for (int n = 0; n < 50; ++n) EXPECT_TRUE(open(*handler, "a.tst"));
        });
    for (std::thread& thread : threads) thread.join();
    EXPECT_FALSE(overlapped);
}

TEST_F(PluginHandler, Libraries_ThatFailCostALineEach) {
    CTempFolder folder;
    folder.write("testplugin_text.so", "this is no library");
    for (const char* name :
         {"testplugin_good", "testplugin_noentry", "testplugin_empty", "testplugin_throwing"})
        std::filesystem::create_symlink(std::string(TEST_PLUGINS "/") + name + ".so",
                                        folder / (std::string(name) + ".so"));
    context->getBaseDirectories()->setPluginDirectory(toURI(folder.path() / ""));
    for (const char* name : {"testplugin_text", "testplugin_noentry", "testplugin_empty",
                             "testplugin_throwing", "testplugin_good"})
        context->addPluginName(name);
    P<CPluginHandler> handler = make<CPluginHandler>(context);

    ASSERT_EQ(handler->getPluginCount(), 1);
    EXPECT_EQ(CString::toStdString(handler->getPlugin(0)->getPluginName()), "testplugin_good");
    const std::string head = "Error while loading DLL: Error - ";
    std::vector<std::string> lines;
    for (const std::string& text : log->lines)
        if (text.starts_with("Error while")) lines.push_back(text.substr(head.size()));
    EXPECT_THAT(lines, ElementsAre("could not load plugin: testplugin_nowhere.so",
                                   "could not load plugin: testplugin_text.so",
                                   "could not load link create function for: testplugin_noentry.so",
                                   "could not load link create plugin object for: testplugin_empty.so",
                                   "no licence"));
    EXPECT_EQ(log->lines.size(), 6u) << "and the loader's own reason for the text file";
    EXPECT_TRUE(open(*handler, "a.tst"));
    EXPECT_FALSE(open(*handler, "refuse.tst"));
}

TEST_F(PluginHandler, Libraries_AreFoundWhereTheEnvironmentSaysUnlessTheContextSaysOtherwise) {
    CTempFolder environment, own;
    const std::filesystem::path good = TEST_PLUGINS "/testplugin_good.so";
    std::filesystem::create_symlink(good, environment / "testplugin_a.so");
    std::filesystem::create_symlink(good, environment / "testplugin_b.so");
    own.write("testplugin_a.so", "shadows the good one");
    CEnvironment path("TONEWRIGHT_PLUGIN_PATH", "/nowhere:" + environment.path().string());
    context->addPluginName("testplugin_a");
    context->addPluginName("testplugin_b");
    EXPECT_EQ(make<CPluginHandler>(context)->getPluginCount(), 2);
    context->getBaseDirectories()->setPluginDirectory(toURI(own.path() / ""));
    EXPECT_EQ(make<CPluginHandler>(context)->getPluginCount(), 1);
    context->clearPluginNames(); // the usual ones then
    for (const char* name : {"sonora2_ffmpeg.so", "sonora2_dsgraph.so", "sonora2_decmpa.so"})
        std::filesystem::create_symlink(good, own / name);
    EXPECT_EQ(make<CPluginHandler>(context)->getPluginCount(), 3);
}

TEST(PluginExtensions, HaveNoDuplicatesAndAreRefusedWhenCutShort) {
    P<CPluginExtensions> list = make<CPluginExtensions>();
    EXPECT_TRUE(list->addExtension(CString::fromUTF8("flac")));
    EXPECT_TRUE(list->addExtension(CString::fromUTF8("wav")));
    EXPECT_FALSE(list->addExtension(CString::fromUTF8("flac")));
    EXPECT_THROW(list->getExtension(2), peru::CInvalidArgError);
    const std::string form = serialise(list);
    for (size_t cut : {form.size() - 1, size_t{12}, size_t{2}})
        EXPECT_THROW(deserialise(list, form.substr(0, cut)), peru::CException) << cut;
}

} // namespace
