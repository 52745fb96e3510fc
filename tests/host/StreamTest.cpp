#include "host/Program.h"

#include <map>

using namespace tests;

namespace {

class Stream : public CProgramTest {
protected:
    void SetUp() override { std::filesystem::create_directory(folder / "tmp"); }
    // Whatever happens, no temporary file remains.
    void TearDown() override { EXPECT_TRUE(std::filesystem::is_empty(folder / "tmp")); }
    // A command for bash, in which "$0" is the program.
    SProcessResult shell(const std::string& command) {
        auto environment = programEnvironment();
        environment.emplace_back("TMPDIR", (folder / "tmp").string());
        return run({"timeout", "-s", "KILL", "60", "bash", "-c", "set -o pipefail; " + command, kProgram},
                   folder.path(), environment);
    }
};

} // namespace

TEST_F(Stream, KeepsEverySampleBetweenPeers) {
    const SSound sound = makeNoise(44100, 2, 16, 30011);
    write("in.wav", sound);
    for (const char* source : {"cat in.wav", "flac -c -s in.wav", "sox in.wav -t aiff -",
                               "sox in.wav -t au -", "ffmpeg -v error -i in.wav -f wav -"})
        for (const char* way : {" | \"$0\" convert - -o - --to wav > out.wav",
                                " | \"$0\" convert - -o - --to .flac | flac -d -s -f -o out.wav -",
                                " | \"$0\" convert - -f -o out.wav > said"}) {
            const SProcessResult result = shell(std::string(source) + way);
            EXPECT_EQ(result.exitCode, 0) << source << way << result.err;
            EXPECT_TRUE(readWav("out.wav") == sound) << source << way;
        }
    EXPECT_EQ(readFile(folder / "said").find("out.wav: WAV, "), 0u);
    for (const char* codec : {"ogg", "mp3"}) { // an MP3 with a tag in front
        const SProcessResult result = shell(std::string("ffmpeg -v error -i in.wav -metadata title=x -f ") +
                                            codec + " - | \"$0\" convert - -o - --to wav > out.wav");
        EXPECT_EQ(result.exitCode, 0) << result.err;
        EXPECT_NEAR(readWav("out.wav").seconds(), sound.seconds(), 0.06) << codec;
    }
}

TEST_F(Stream, CarriesNothingButTheSound) {
    write("in.wav", makeTone(8000, 1, 16, 0.2));
    const SProcessResult result = shell("\"$0\" convert in.wav -o - --to flac --rate 44.1k | flac -t -s -");
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.err.find("-: FLAC, 0:00.2, "), 0u) << result.err;
    // Also without an extension
    std::filesystem::rename(folder / "in.wav", folder / "song");
    EXPECT_EQ(shell("\"$0\" convert song -q -o song.flac && flac -t -s song.flac").err, "");
}

TEST_F(Stream, HasAFormatByItsFirstBytes) {
    const std::string unknown = "No plug-in reads files without an extension",
                      ogg = "OggS" + std::string(24, '\0'), id3 = "ID3\x4" + std::string(4, '\0');
    const std::pair<std::string, std::vector<std::string>> kStarts[] = {
        // by the reasons why the rest is refused
        {"WAV file", {"RIFFxxxxWAVE", "RIFXxxxxWAVE"}},
        {"RF64 file", {"RF64xxxxWAVE"}},
        {"Channel count", {"FORMxxxxAIFF", "FORMxxxxAIFC", ".snd"}},
        {"not recognised", {"caff"}},
        {"W64 file", {"riff\x2e\x91\xcf\x11"}},
        {"no FLAC stream", {"fLaC"}},
        {"no Vorbis stream", {"OggS"}},
        {"there is no decoder for it", {"MAC "}},
        {"Could not open: ",
         {"xxxxftyp", "\x30\x26\xb2\x75\x8e\x66\xcf\x11", "\x1a\x45\xdf\xa3", "wvpk", "TTA1", "MPCK", "MP+"}},
        {"End of file", {ogg + "OpusHead", ogg + "Speex"}},
        {"Invalid argument", {id3 + "\x1\x2" + std::string(130, 'x') + "wvpk"}},
        {"whole frame", {"\xff\xfb\x90", "\xff\xe2\x10", id3 + std::string(2, '\0')}},
        {unknown,
         {"RIFFxxxxAVI ", "xxxxxxxxWAVE", "FORMxxxxILBM", "xxxxxxxxAIFF", "ftypxxxx", "ID3\x4",
          "\xfe\xfb\x90", "\xff\xdb\x90", "\xff\xeb\x90", "\xff\xf9\x90", "\xff\xfb\xf0", "\xff\xfb\x9c",
          "\xff\xfb"}},
    };
    std::vector<std::string> command = words("--boxed=none convert --json --to au");
    std::map<std::string, std::string> reasons;
    for (const auto& [reason, starts] : kStarts)
        for (const std::string& start : starts) {
            const std::string& name = command.emplace_back(std::to_string(reasons.size()));
            const bool isWhole = start.size() <= 10 && (reason == unknown || reason == "whole frame");
            folder.write(name, isWhole || start.size() > 100 ? start : start + std::string(300, '\0'));
            reasons[name] = reason;
        }
    const auto events = parseLines(tonewright(command).out);
    EXPECT_EQ(events.size(), 2 * reasons.size());
    for (const nlohmann::json& event : events)
        if (event["event"] == "error") {
            const std::string message = event["message"], reason = reasons[event["input"]];
            EXPECT_TRUE(has(message, reason));
        }
}

TEST_F(Stream, EndsWithItsReader) {
    write("in.wav", makeNoise(44100, 2, 16, 500000));
    const SProcessResult result =
        shell("\"$0\" convert -q in.wav -o - --to wav | head -c 1000 > start; echo ${PIPESTATUS[0]}");
    EXPECT_EQ(result.out + result.err, "1\n");
    EXPECT_EQ(shell("\"$0\" convert -q in.wav -o - --to wav > /dev/full").err,
              "tonewright: in.wav: Standard output cannot be written: No space left on device\n");
}

TEST_F(Stream, IsRefusedWhereItMakesNoSense) {
    write("in.wav", makeTone(8000, 1, 16, 0.2));
    static const struct {
        const char* command;
        int code;
        const char* reason;
    } kCases[] = {
        {"\"$0\" convert in.wav -o -", 2, "--to"},
        {"\"$0\" convert in.wav -o - --to wav --json", 2, "--json"},
        {"\"$0\" convert - in.wav -o - --to wav < in.wav", 2, "one input"},
        {"\"$0\" convert - --to wav < in.wav", 2, "--output"},
        {"script -qec \"'$0' convert in.wav -o - --to wav\" /dev/null", 2, "terminal"},
        {"\"$0\" convert - -o out.wav < /dev/null", 1, "The file is empty"},
        {"echo text without sound | \"$0\" convert - -o out.wav", 1, "-: The format is unknown"},
        {"\"$0\" convert - -o - --to xyz < in.wav", 1, "No plug-in writes .xyz files"},
        {"\"$0\" convert in.wav -o - --to ogg --bitrate 900k", 1, "Could not write -: 900000 bit/s"},
        {"TMPDIR=/missing \"$0\" convert - -o out.wav < in.wav", 1, "/missing: No such file"},
    };
    for (const auto& each : kCases) {
        const SProcessResult result = shell(each.command);
        EXPECT_EQ(result.exitCode, each.code) << each.command;
        EXPECT_TRUE(has((result.out + result.err), each.reason)) << each.command << result.out << result.err;
        EXPECT_EQ(list(), (std::set<std::string>{"in.wav", "tmp/"})) << each.command;
    }
}
