#include "host/Program.h"
#include "support/Environment.h"

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

    CEnvironment configuration{"XDG_CONFIG_HOME", folder / "config"};
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
        {{"--preset", "archive"}, "in.flac", "flac,48000,2"},
        {{"--preset", "cd", "-o", "out/"}, "out/in.wav", "pcm_s16le,44100,2"},
        {{"--preset", "cd", "-o", "cd.aiff"}, "cd.aiff", "pcm_s16be,44100,2"},
        {{"--preset", "podcast"}, "in.mp3", "mp3,44100,1"},
        {{"--preset", "portable"}, "in.mp3", "mp3,48000,2"},
        {{"--preset", "speech"}, "in.ogg", "vorbis,24000,1"},
        {{"--preset", "podcast", "--to", "ogg", "--channels", "2"}, "in.ogg", "vorbis,44100,2"},
        {{"--preset", "podcast", "--to", "flac", "--quality", "1"}, "in.flac", "flac,44100,1"},
        {{"--preset", "mine"}, "in.mp3", "mp3,44100,1"},
        {{"--rate", "22.05kHz", "--preset", "mine"}, "in.mp3", "mp3,22050,1"},
        {{"--preset", "phone"}, "in.au", "pcm_s24be,11025,2"},
    };
    for (const auto& each : kCases) {
        SCOPED_TRACE(testing::PrintToString(each.options));
        succeed(with({"convert", "in.wav", "-f", "-q"}, each.options));
        EXPECT_EQ(probe(each.output), each.expected);
    }
    define("loud", "to = wav\nnormalize = -20\n");
    const std::string converted =
        tonewright({"convert", "in.wav", "-o", "loud.wav", "--preset", "loud", "--allow-clipping", "--json"})
            .out;
    EXPECT_TRUE(has(converted, "\"gain\""));
    std::filesystem::remove(folder / "config/tonewright/presets/loud.ini");
    const std::string listed = tonewright({"convert", "--list-presets"}).out;
    for (const char* name : {"archive", "cd", "mine", "phone", "podcast", "portable", "speech"})
        EXPECT_TRUE(has(("\n" + listed), "\n" + std::string(name) + " "));
    EXPECT_EQ(std::count(listed.begin(), listed.end(), '\n'), 7);
    EXPECT_TRUE(has(listed, "\ncd           sound for an audio CD: to wav, rate 44100, channels 2, "));
    // Without a folder for all programs' settings, there is the one of the user's.
    const CEnvironment none("XDG_CONFIG_HOME", "config"), home("HOME", folder.path().string());
    std::filesystem::rename(folder / "config", folder / ".config");
    EXPECT_TRUE(has(succeed({"convert", "--list-presets"}),
                    "\nmine         " + (folder / ".config/tonewright/presets/mine.ini\n").string()));
}

// Some of these would silently give another file than the user expects.
TEST_F(Preset, AndOptionsAreRefusedWithoutEffect) {
    static const struct {
        const char* output;
        std::vector<std::string> options;
        const char* reason; // null if the options have an effect
    } kCases[] = {
        {"out.wav", {"--quality", "0.5"}, "--quality has no effect on .wav files"},
        {"out.wav", {"--bitrate", "192k"}, "--bitrate has no effect on .wav files"},
        {"out.flac", {"--bitrate", "192k"}, "--bitrate has no effect on .flac files"},
        {"out.flac", {"--preset", "podcast"}, "--bitrate has no effect on .flac files"},
        {"out.mp3", {"--bits", "16"}, "--bits has no effect on .mp3 files"},
        {"out.ogg", {"--preset", "phone"}, "--bits has no effect on .ogg files"},
        {"out.flac", {"--quality", "0.5", "--bits", "16"}, nullptr},
        {"out.mp3", {"--quality", "0.5"}, nullptr},
        {"out.ogg", {"--bitrate", "96k"}, nullptr},
    };
    for (const auto& each : kCases) {
        const SProcessResult result =
            tonewright(with({"convert", "in.wav", "-q", "-o", each.output}, each.options));
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
        const SProcessResult result = tonewright({"convert", "in.wav", "--to", "mp3", "--preset", "bad"});
        EXPECT_EQ(result.exitCode, 2) << each.text;
        EXPECT_TRUE(has(result.err, "/tonewright/presets/bad.ini"));
        EXPECT_TRUE(has(result.err, each.reason));
    }
    std::filesystem::create_directories(folder / "config/tonewright/presets/folder.ini");
    EXPECT_TRUE(
        has(tonewright({"convert", "in.wav", "--preset", "folder"}).err, "folder.ini cannot be read"));
    const SProcessResult unknown = tonewright({"convert", "in.wav", "--preset", "none"});
    EXPECT_TRUE(has(unknown.err, "no preset none; known are archive"));
}
