#include "host/Program.h"

#include <gmock/gmock.h>

#include <map>

namespace {

using namespace tests;
using testing::HasSubstr;
using testing::Not;

class Normalize : public CProgramTest {
protected:
    nlohmann::json measure(const std::string& file) {
        for (const nlohmann::json& event : parseLines(succeed({"loudness", "--json", file})))
            if (event["event"] == "done") return event;
        return {};
    }
    // Returns the warnings.
    std::string convert(std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), "convert");
        const SProcessResult result = tonewright(arguments);
        EXPECT_EQ(result.exitCode, 0);
        return result.err;
    }
    // Noise at that level in decibels, and a click of 0.9 if `hasPeak`.
    SSound makeSound(int rate, int channels, double level, bool hasPeak) {
        SSound sound{rate, channels, 16, {}};
        std::mt19937 random(1);
        double smooth = 0;
        for (int i = 0; i < rate * channels; ++i) {
            smooth += 0.2 * (static_cast<double>(random()) / 2147483648.0 - 1.0 - smooth);
            const double sample =
                hasPeak && i / channels == rate / 2 ? 0.9 : std::pow(10, level / 20) * smooth;
            appendNumber(sound.samples, static_cast<uint32_t>(std::lround(sample * 32767)) & 0xFFFF, 2);
        }
        return sound;
    }
};

} // namespace

TEST_F(Normalize, EveryOutputHasTheLoudness) {
    write("in.wav", makeSound(44100, 2, -20, false));
    // Floating-point samples up to three times full scale
    peer({"ffmpeg", "-v", "error", "-i", "in.wav", "-af", "volume=30dB", "-c:a", "pcm_f32le", "float.wav"});
    static const struct {
        const char* input;
        std::string output;
        double target, tolerance;
        std::vector<std::string> options;
    } kCases[] = {
        {"in.wav", "a.flac", -18, 0.05, {}},
        {"in.wav", "c.wav", -23, 0.05, {"--rate", "48000", "--channels", "1"}},
        {"in.wav", "d.wav", -18, 0.05, {"--rate", "22050", "--bits", "8"}},
        {"in.wav", "e.ogg", -20, 0.3, {}},
        {"in.wav", "f.mp3", -16, 0.3, {}},
        {"float.wav", "g.wav", -14, 0.05, {}},
        {"float.wav", "h.flac", -18, 0.05, {"--bits", "16"}},
        {"float.wav", "i.flac", -20, 0.05, {"--rate", "32000", "--salvage"}},
    };
    for (const auto& each : kCases) {
        SCOPED_TRACE(each.output);
        EXPECT_EQ(tonewright(with({"convert", each.input, "-o", each.output,
                                   "--normalize=" + std::to_string(each.target)},
                                  each.options))
                      .exitCode,
                  0);
        const nlohmann::json result = measure(each.output);
        EXPECT_NEAR(result["integrated"], each.target, each.tolerance);
        EXPECT_LE(result["true_peak"], -0.5);
    }
}

TEST_F(Normalize, PeaksLimitTheGainUnlessClippingIsAllowed) {
    write("in.wav", makeSound(44100, 2, -30, true));
    const std::string message = convert({"in.wav", "-o", "limited.wav", "--normalize"});
    EXPECT_THAT(message, HasSubstr("tonewright: in.wav: The gain is limited to +0.0 dB instead of +"));
    EXPECT_TRUE(readWav("limited.wav") == readWav("in.wav"));
    EXPECT_EQ(convert({"in.wav", "-o", "clipped.wav", "--normalize", "--allow-clipping"}), "");
    EXPECT_NEAR(measure("clipped.wav")["integrated"], -18.0, 3.0) << "less the energy of the peak";

    write("short.wav", makeTone(8000, 1, 16, 0.3));
    EXPECT_THAT(convert({"short.wav", "-o", "same.wav", "--normalize"}), HasSubstr("too short"));
    EXPECT_TRUE(readWav("same.wav") == readWav("short.wav"));
    for (const std::vector<std::string>& options : {std::vector<std::string>{"--album"},
                                                    {"--allow-clipping"},
                                                    {"--normalize=1"},
                                                    {"--normalize=x"},
                                                    {"--normalize", "-14"}})
        EXPECT_EQ(tonewright(with({"convert", "in.wav", "-o", "never.wav"}, options)).exitCode, 2);
}

TEST_F(Normalize, AlbumsKeepTheDifferencesBetweenTheirFiles) {
    std::filesystem::create_directory(folder / "in");
    write("in/a.wav", makeSound(44100, 2, -20, false));
    write("in/b.wav", makeSound(22050, 1, -30, false));
    folder.write("in/c.flac", "no sound");
    const std::vector<std::string> command{"convert", "-r", "in",   "--to",
                                           "wav",     "-o", "out/", "--normalize=-23.5",
                                           "--album", "-j", "2",    "--json"};
    const SProcessResult result = tonewright(command);
    EXPECT_EQ(result.exitCode, 1);
    std::vector<double> gains;
    std::map<std::string, int> counts;
    for (const nlohmann::json& event : parseLines(result.out)) {
        ++counts[event["event"]];
        if (event["event"] == "done") gains.push_back(event["gain"]);
    }
    EXPECT_EQ(counts["start"], 3);
    EXPECT_EQ(counts["error"], 1);
    ASSERT_EQ(gains.size(), 2u);
    EXPECT_EQ(gains[0], gains[1]);
    const auto all = parseLines(succeed({"loudness", "--json", "out/a.wav", "out/b.wav"})).back();
    EXPECT_NEAR(all["integrated"], -23.5, 0.1);

    // A repeated run finds the same gain.
    const std::string before = readFile(folder / "out/b.wav");
    std::filesystem::remove(folder / "out/b.wav");
    EXPECT_EQ(tonewright(with(command, {"--skip"})).exitCode, 1);
    EXPECT_EQ(readFile(folder / "out/b.wav"), before);
}

TEST_F(Normalize, OldGainsOfPlayersAreNotCarriedAlong) {
    write("in.wav", makeSound(44100, 2, -20, false));
    succeed({"convert", "in.wav", "-o", "in.flac"});
    succeed({"tag", "set", "in.flac", "--title", "A title", "--field", "REPLAYGAIN_TRACK_GAIN=-5.00 dB",
             "--field", "replaygain_album_peak=0.9"});
    for (const char* output : {"out.mp3", "out.ogg", "out.flac"}) {
        succeed({"convert", "in.flac", "-o", output, "-f", "--normalize"});
        const std::string tag = succeed({"tag", "show", "--all", output});
        EXPECT_THAT(tag, HasSubstr("A title"));
        EXPECT_THAT(tag, Not(testing::ContainsRegex("[Rr][Ee][Pp][Ll][Aa][Yy][Gg][Aa][Ii][Nn]"))) << output;
    }
    // Measured and encoded from a pipe.
    const SProcessResult piped =
        run({"sh", "-c",
             std::string(kProgram) + " convert - -o - --to wav --normalize=-25 < in.flac | " + kProgram +
                 " loudness --json -"},
            folder.path(), programEnvironment());
    EXPECT_THAT(piped.out, HasSubstr("\"integrated\":-25.0")) << piped.out << piped.err;
}
