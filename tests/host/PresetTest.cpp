#include "host/Program.h"

using namespace tests;

namespace {

class Preset : public CProgramTest {
protected:
    void SetUp() override {
        std::filesystem::create_directories(folder / "config/tonewright/presets");
        write("in.wav", makeTone(48000, 2, 24, 0.3));
    }
    void define(const std::string& name, const std::string& text) {
        folder.write("config/tonewright/presets/" + name + ".ini", text);
    }
    SProcessResult withPresets(std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), kProgram);
        auto environment = programEnvironment();
        environment.emplace_back("XDG_CONFIG_HOME", (folder / "config").string());
        return run(arguments, folder.path(), environment);
    }
    // "codec rate channels"
    std::string probe(const std::string& file) {
        const auto told =
            nlohmann::json::parse(peer({"ffprobe", "-v", "error", "-of", "json", "-show_entries",
                                        "stream=codec_name,sample_rate,channels", file}));
        const nlohmann::json& stream = told["streams"][0];
        return stream["codec_name"].get<std::string>() + " " + stream["sample_rate"].get<std::string>() +
               " " + std::to_string(stream["channels"].get<int>());
    }
};

} // namespace

TEST_F(Preset, SetsWhatTheUserDoesNot) {
    define("mine", "; for the car\nto = mp3\nrate = 44.1k\nchannels = 1\nbitrate = 64k\n");
    define("phone", "to = au\nrate = 11025\n");
    static const struct {
        std::vector<std::string> options;
        const char* output;
        const char* expected;
    } kCases[] = {
        {{"--preset", "archive"}, "in.flac", "flac 48000 2"},
        {{"--preset", "cd", "-o", "out/"}, "out/in.wav", "pcm_s16le 44100 2"},
        {{"--preset", "cd", "-o", "cd.aiff"}, "cd.aiff", "pcm_s16be 44100 2"},
        {{"--preset", "podcast"}, "in.mp3", "mp3 44100 1"},
        {{"--preset", "portable"}, "in.mp3", "mp3 48000 2"},
        {{"--preset", "speech"}, "in.ogg", "vorbis 24000 1"},
        {{"--preset", "podcast", "--to", "ogg", "--channels", "2"}, "in.ogg", "vorbis 44100 2"},
        {{"--preset", "podcast", "--to", "flac", "--quality", "1"}, "in.flac", "flac 44100 1"},
        {{"--preset", "mine"}, "in.mp3", "mp3 44100 1"},
        {{"--rate", "22.05kHz", "--preset", "mine"}, "in.mp3", "mp3 22050 1"},
        {{"--preset", "phone"}, "in.au", "pcm_s24be 11025 2"},
    };
    for (const auto& each : kCases) {
        std::vector<std::string> command{"convert", "in.wav", "-f", "-q"};
        command.insert(command.end(), each.options.begin(), each.options.end());
        SCOPED_TRACE(testing::PrintToString(command));
        const SProcessResult result = withPresets(command);
        EXPECT_EQ(result.exitCode, 0) << result.err;
        EXPECT_EQ(probe(each.output), each.expected);
    }
    define("loud", "to = wav\nnormalize = -20\n");
    const std::string converted =
        withPresets({"convert", "in.wav", "-o", "loud.wav", "--preset", "loud", "--allow-clipping", "--json"})
            .out;
    EXPECT_NE(converted.find("\"gain\""), std::string::npos) << converted;
    std::filesystem::remove(folder / "config/tonewright/presets/loud.ini");
    const std::string listed = withPresets({"convert", "--list-presets"}).out;
    for (const char* name : {"archive", "cd", "mine", "phone", "podcast", "portable", "speech"})
        EXPECT_NE(("\n" + listed).find("\n" + std::string(name) + " "), std::string::npos) << listed;
    EXPECT_EQ(std::count(listed.begin(), listed.end(), '\n'), 7);
}

// Some of these would silently give another file than the user expects.
TEST_F(Preset, AndOptionsAreRefusedWithoutEffect) {
    static const struct {
        const char* output;
        std::vector<std::string> options;
        const char* reason; // null if the options have an effect
    } kCases[] = {
        {"out.wav", {"--quality", "0.5"}, "--quality has no effect on .wav files"},
        {"out.aiff", {"--quality", "0.5"}, "--quality has no effect on .aiff files"},
        {"out.wav", {"--bitrate", "192k"}, "--bitrate has no effect on .wav files"},
        {"out.flac", {"--bitrate", "192k"}, "--bitrate has no effect on .flac files"},
        {"out.flac", {"--preset", "podcast"}, "--bitrate has no effect on .flac files"},
        {"out.mp3", {"--bits", "16"}, "--bits has no effect on .mp3 files"},
        {"out.ogg", {"--preset", "phone"}, "--bits has no effect on .ogg files"},
        {"out.flac", {"--quality", "0.5", "--bits", "16"}, nullptr},
        {"out.caf", {"--bits", "24"}, nullptr},
        {"out.mp3", {"--quality", "0.5"}, nullptr},
        {"out.ogg", {"--bitrate", "96k"}, nullptr},
    };
    for (const auto& each : kCases) {
        std::vector<std::string> command{"convert", "in.wav", "-q", "-o", each.output};
        command.insert(command.end(), each.options.begin(), each.options.end());
        const SProcessResult result = withPresets(command);
        EXPECT_EQ(result.exitCode, each.reason ? 2 : 0) << each.output << result.err;
        EXPECT_EQ(result.err.find(each.reason ? each.reason : "tonewright"),
                  each.reason ? 12 : std::string::npos)
            << result.err;
        EXPECT_EQ(std::filesystem::exists(folder / each.output), !each.reason);
    }
}

TEST_F(Preset, IsRefusedWithFileAndKey) {
    static const struct {
        const char* text;
        const char* reason;
    } kCases[] = {
        {"rat = 44100\n", "rat is not a key; known are to, rate"},
        {"rate = fast\n", "--rate: fast is not a number"},
        {"bitrate = 192\n", "192k means 192000"},
        {"quality = 2\n", "quality"},
        {"channels = 1\nrate\n", "rate"},
        {"[mp3]\nrate = 44100\n", "sections, such as mp3"},
        {"rate = 44100, 48000\n", "rate takes one value"},
        {"rate = 44100\nbits = 16\nrate = 48000\n", "rate is set twice"},
        {"max-bitrate = 128k\n", "needs bitrate"},
        {"normalize = loud\n", "--normalize: loud"},
        {"quality = 0.5\nbitrate = 128k\n", "exclude each other"},
        {"# nothing\n", "sets nothing"},
    };
    for (const auto& each : kCases) {
        define("bad", each.text);
        const SProcessResult result = withPresets({"convert", "in.wav", "--to", "mp3", "--preset", "bad"});
        EXPECT_EQ(result.exitCode, 2) << each.text;
        EXPECT_NE(result.err.find("/tonewright/presets/bad.ini"), std::string::npos) << result.err;
        EXPECT_NE(result.err.find(each.reason), std::string::npos) << result.err;
    }
    const SProcessResult unknown = withPresets({"convert", "in.wav", "--preset", "none"});
    EXPECT_NE(unknown.err.find("no preset none; known are archive"), std::string::npos) << unknown.err;
}
