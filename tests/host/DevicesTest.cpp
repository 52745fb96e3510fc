#include "host/Sound.h"

using namespace tests;

namespace {

class Devices : public CSoundTest {
protected:
    Devices() : CSoundTest(EMicrophone::isolated) {}
};

} // namespace

TEST_F(Devices, AreListedWithTheirDefaults) {
    std::set<std::string> defaults, names;
    for (const nlohmann::json& device : parseLines(succeed({"devices", "--json"}))) {
        const std::string direction = device["direction"];
        names.insert(direction + " " + device["name"].get<std::string>());
        if (device["default"]) defaults.insert(direction + " " + device["name"].get<std::string>());
        EXPECT_FALSE(device["id"].get<std::string>().empty());
        EXPECT_FALSE(device["api"].get<std::string>().empty());
        EXPECT_GE(device["channels"], 2);
    }
    EXPECT_EQ(defaults, (std::set<std::string>{"output default", "input default"}));
    EXPECT_EQ(names.count("input microphone"), 1u);
    EXPECT_EQ(names.count("output microphone"), 0u);

    const std::string table = succeed({"devices"});
    for (const char* word : {"direction", "output", "input", "default", "microphone"})
        EXPECT_TRUE(has(table, word));
}

TEST_F(Devices, AreWatched) {
    const std::string path = std::getenv("ALSA_CONFIG_PATH"), before = readFile(path);
    CProcess program({kProgram, "devices", "--watch", "--json"}, folder.path(), programEnvironment());
    const auto happens = [&](const std::string& event, const std::string& name) {
        const nlohmann::json found = waitFor(program, [&](const auto& line) {
            return line["event"] == event && line["direction"] == "output" && line["name"] == name;
        });
        return !found.is_null();
    };
    CProcess text({kProgram, "devices", "--watch"}, folder.path(), programEnvironment());
    const auto isShown = [&](const std::string& line) {
        return waitUntil([&] { return text.readOut().find(line) != std::string::npos; });
    };
    EXPECT_TRUE(isShown("present  output ") && isShown(" default "));
    EXPECT_TRUE(happens("present", "default"));
    folder.write("new.conf", "pcm.aaa { type pulse server \"" + std::string(std::getenv("PULSE_SERVER")) +
                                 "\" }\n" + before);
    std::filesystem::copy_file(folder / "new.conf", path, std::filesystem::copy_options::overwrite_existing);
    EXPECT_TRUE(happens("added", "aaa"));
    EXPECT_TRUE(isShown("added    output  "));
    std::ofstream(path) << before;
    EXPECT_TRUE(happens("removed", "aaa"));
    EXPECT_TRUE(isShown("removed  output  "));
    text.signal(SIGINT);
    EXPECT_EQ(text.wait().exitCode, 0);
    program.signal(SIGTERM);
    const SProcessResult result = program.wait();
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.err, "");
}

TEST_F(Devices, OtherThanTheDefaultPlayToo) {
    std::ofstream(std::getenv("ALSA_CONFIG_PATH"), std::ios::app)
        << "pcm.other { type pulse server \"" << std::getenv("PULSE_SERVER") << "\" device \"fx_mic\" }\n";
    write("in.wav", makeLoudNoise(0.2));
    const auto heard = server.listen();
    EXPECT_EQ(succeed({"play", "in.wav", "--device", "other"}), "in.wav: 0:00.2 played\n");
    EXPECT_EQ(trim(heard->readOut()), "");
    succeed({"play", "in.wav"});
    EXPECT_TRUE(waitUntil([&] { return !trim(heard->readOut()).empty(); }));
}

TEST_F(Devices, AreMissedInOneLine) {
    server.kill();
    write("in.wav", makeTone(44100, 2, 16, 0.1));
    const std::vector<std::vector<std::string>> commands{
        {"devices"}, {"devices", "--json"}, {"play", "in.wav"}, {"record", "-o", "out.wav"}};
    for (const std::vector<std::string>& command : commands) {
        const SProcessResult result = tonewright(command);
        EXPECT_EQ(result.exitCode, 3);
        EXPECT_EQ(parseLines(result.out).size(), command.back() == "--json" ? 1u : 0u);
        EXPECT_EQ(result.err.substr(0, 21), "tonewright: There is ") << result.err;
        EXPECT_EQ(result.err.find('\n'), result.err.size() - 1) << result.err;
    }
    EXPECT_EQ(list(), std::set<std::string>{"in.wav"});
}

TEST_F(Devices, ThatDoNotExistAreNotRecorded) {
    const SProcessResult result = tonewright({"record", "-o", "out.wav", "--device", "4711"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_TRUE(has(result.err, "4711"));
    EXPECT_EQ(list(), std::set<std::string>{});
}
