#include "sonora2/plugins/PluginDescription.h"

#include "peru/uri/URI.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/plugins/BuildId.h"
#include "sonora2/plugins/PluginHandler.h"
#include "support/LogLines.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gmock/gmock.h>

namespace {

using namespace sonora2::common;
using namespace tests;

constexpr const char* kLibrary = TEST_PLUGINS "/testplugin_good.so";

std::string print(const SPluginDescription& description) {
    std::ostringstream stream;
    writeDescription(stream, description);
    return stream.str();
}

std::optional<SPluginDescription> parse(const std::string& text) {
    std::istringstream stream(text);
    return readDescription(stream);
}

TEST(PluginDescription, ComesBackAndIsRejectedWhereverItIsCut) {
    const SPluginDescription description{"0a1b", "sonora2_x", 18, {{2, {"a", "7z"}}, {16, {}}, {18, {"b"}}}};
    const std::string text = print(description);
    EXPECT_EQ(parse(text), description);
    for (size_t size = 0; size + 1 < text.size(); ++size) EXPECT_FALSE(parse(text.substr(0, size))) << size;
    EXPECT_FALSE(parse("plugin 2" + text.substr(text.find('\n')))) << "another form";
}

TEST(PluginDescription, BuildIdIsTheLinkers) {
    const SProcessResult notes = run({"readelf", "-nW", kLibrary});
    ASSERT_EQ(notes.exitCode, 0) << notes.err;
    EXPECT_THAT(notes.out, testing::HasSubstr("Build ID: " + getBuildId(kLibrary)));
    EXPECT_GE(getBuildId(kLibrary).size(), 16u);

    CTempFolder folder;
    const std::string bytes = readFile(kLibrary).substr(0, 4096);
    for (size_t size = 0; size < bytes.size(); size += 61)
        getBuildId(folder.write("cut", bytes.substr(0, size))); // the sanitizers watch
    EXPECT_EQ(getBuildId(folder.write("text", "no library")), "");
}

// A context with one plug-in, whose library has a path of its own.
class DescribedPlugin : public testing::Test {
protected:
    DescribedPlugin() {
        std::filesystem::copy_file(kLibrary, library);
        context->setLogManager(log);
        context->getBaseDirectories()->setPluginDirectory(toURI(folder.path() / ""));
        context->addPluginName("testplugin_good");
    }
    void describe(const std::string& buildId, const std::string& name = "testplugin_good") {
        folder.write("testplugin_good.plugin",
                     print({buildId, name, 18, {{2, {"tst", "old"}}, {16, {"tst"}}}}));
    }
    bool isLoaded() const { return readFile("/proc/self/maps").find(library.string()) != std::string::npos; }
    static P<IAudioSource> open(CPluginHandler& handler) {
        return handler.createAudioSource(peru::make<peru::CURI>("file:///x/a.tst"), 44100, 2, 2, false);
    }

    CTempFolder folder;
    const std::filesystem::path library = folder / "testplugin_good.so";
    P<ISonoraContext> context = peru::make<sonora2::audio::CSonoraContextAudio>();
    P<CLogLines> log = peru::make<CLogLines>();
};

TEST_F(DescribedPlugin, IsLoadedWithItsFirstMediumAndThenAnswersItself) {
    describe(getBuildId(library));
    const auto handler = peru::make<CPluginHandler>(context);
    ASSERT_EQ(handler->getPluginCount(), 1);
    EXPECT_EQ(handler->getValidExtensions(kAudioSource)->getCount(), 2);
    EXPECT_EQ(handler->getPlugin(0)->getValidTypes(), 18);
    EXPECT_FALSE(isLoaded());
    EXPECT_THAT(log->lines, testing::IsEmpty());

    EXPECT_TRUE(open(*handler));
    EXPECT_TRUE(isLoaded());
    EXPECT_THAT(log->lines,
                testing::ElementsAre("the description of plugin testplugin_good does not match its library"));
    EXPECT_EQ(handler->getValidExtensions(kAudioSource)->getCount(), 1);
    EXPECT_NE(handler->getPlugin(0)->getValidTypes(), 18);
}

TEST_F(DescribedPlugin, ForeignDescription_DoesNotCount) {
    for (const auto& [id, name] : {std::pair(std::string("00"), "testplugin_good"),
                                   {"", "testplugin_good"},
                                   {getBuildId(library), "testplugin_other"}}) {
        describe(id, name);
        const auto handler = peru::make<CPluginHandler>(context);
        EXPECT_TRUE(isLoaded()) << id << " " << name;
        EXPECT_EQ(handler->getValidExtensions(kAudioSource)->getCount(), 1);
    }
}

TEST_F(DescribedPlugin, LibraryThatCannotBeLoaded_IsReportedOnceAndSkipped) {
    describe(getBuildId(library));
    const auto handler = peru::make<CPluginHandler>(context);
    std::filesystem::remove(library);
    folder.write("testplugin_good.so", "no library");
    EXPECT_FALSE(open(*handler));
    EXPECT_FALSE(open(*handler));
    const auto startsWith = [](const char* text) { return testing::StartsWith(text); };
    const auto tried =
        startsWith("tried to open file:///x/a.tst with plugin testplugin_good.\nOpening failed: Error");
    EXPECT_THAT(log->lines, testing::ElementsAre(
                                startsWith("Error loading library"),
                                "Error while loading DLL: Error - could not load plugin: testplugin_good.so",
                                tried, startsWith("Error loading library"), tried));
}

} // namespace
