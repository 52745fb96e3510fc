#include "host/Program.h"

#include <gmock/gmock.h>

#include <map>

namespace {

using namespace tests;
using testing::HasSubstr;

class LoudnessCommand : public CProgramTest {
protected:
    // The events "done", by the names of the inputs, and "album".
    std::map<std::string, nlohmann::json> measure(const std::vector<std::string>& arguments) {
        std::map<std::string, nlohmann::json> results;
        for (const nlohmann::json& event : parseLines(succeed(with({"loudness", "--json"}, arguments))))
            if (event["event"] == "done")
                results[event["input"]] = event;
            else if (event["event"] == "album")
                results["album"] = event;
        return results;
    }
};

// What sox makes of nothing; without what is near half the sample rate, where the meters' interpolations
// differ, and without abrupt ends.
struct SRecording {
    int rate, bits, channels;
    std::string effects;
};
const SRecording kRecordings[] = {
    {8000, 8, 1, "synth 1.5 pinknoise lowpass 1500"},
    {32000, 16, 2, "synth 1.5 whitenoise lowpass 4000 lowpass 4000"},
    {44100, 16, 2, "synth 1.5 pinknoise lowpass 8000 lowpass 8000"},
    {44100, 16, 2, "synth 1.5 sine 997 vol 0.001"},
    {44100, 16, 2, "synth 0.8 pinknoise lowpass 6000 pad 0.6 0.6"},
    {44100, 24, 4, "synth 1.5 sine 500 sine 600 sine 700 sine 800 vol 0.4"},
    {48000, 16, 6, "synth 1.5 brownnoise vol 0.4"},
    {192000, 24, 2, "synth 1 pinknoise lowpass 12000"},
};

double numberAfter(const std::string& text, size_t from, const std::string& key) {
    const size_t at = text.find(key, from);
    return at == std::string::npos ? NAN : std::atof(text.c_str() + at + key.size());
}

} // namespace

TEST_F(LoudnessCommand, AgreesWithAnotherProgram) {
    std::vector<std::string> files, judge{"ffmpeg", "-hide_banner", "-nostats"};
    std::string graph;
    for (const SRecording& each : kRecordings) {
        const std::string number = std::to_string(files.size());
        files.push_back(number + ".wav");
        peer(words("sox -R -D -n -r " + std::to_string(each.rate) + " -b " + std::to_string(each.bits) +
                   " -c " + std::to_string(each.channels) + " " + files.back() + " " + each.effects +
                   " gain -1 fade 0.05 -0 0.05"));
        judge.insert(judge.end(), {"-i", files.back()});
        graph += "[" + number + "]ebur128=peak=true[o" + number + "];";
    }
    graph.pop_back();
    judge.insert(judge.end(), {"-filter_complex", graph});
    for (size_t i = 0; i < files.size(); ++i)
        judge.insert(judge.end(), {"-map", "[o" + std::to_string(i) + "]"});
    judge.insert(judge.end(), {"-f", "null", "-"});
    const std::string summary = run(judge, folder.path()).err;
    std::map<std::string, nlohmann::json> measured = measure(files);
    ASSERT_EQ(measured.size(), files.size() + 1);
    for (size_t i = 0; i < files.size(); ++i) {
        SCOPED_TRACE(kRecordings[i].effects + " " + std::to_string(kRecordings[i].rate));
        // The last one with that beginning: ffmpeg may set up its filters more than once.
        const size_t at = summary.rfind("[Parsed_ebur128_" + std::to_string(i) + " @");
        ASSERT_NE(at, std::string::npos) << summary;
        // Half of a digit more, since the summary is rounded.
        EXPECT_NEAR(measured[files[i]]["integrated"], numberAfter(summary, at, "I:"), 0.15);
        EXPECT_NEAR(measured[files[i]]["true_peak"], numberAfter(summary, at, "Peak:"), 0.25);
    }
}

TEST_F(LoudnessCommand, PrintsGainsOfFilesAndOfAllTogether) {
    // -9.03 LUFS with a peak of -6.02 dB in one channel, and 40 dB less
    const SSound loud = makeTone(48000, 1, 24, 4, 1000);
    write("10.wav", loud);
    peer({"sox", "-D", "10.wav", "9.wav", "vol", "-40dB"});
    write("silent.wav", {48000, 2, 16, std::string(192000, '\0')});
    folder.write("list.m3u", "9.wav\nsilent.wav\n10.wav\n");
    folder.write(
        "album.cue",
        "INDEX 1 x\nFILE 10.wav WAVE\nTRACK 01 AUDIO\nREM 1 x\nINDEX 01 00:00:00\nTRACK 02 AUDIO\nINDEX 01 "
        "00:01:00\n");
    const std::string table = "   LUFS     LU   dBTP    gain  limited  file\n"
                              "  -49.0    0.0  -46.0   +31.0        -  9.wav\n"
                              "      -      -      -       -        -  silent.wav\n"
                              "   -9.0    0.0   -6.0    -9.0        -  10.wav\n";
    EXPECT_EQ(succeed({"loudness", "list.m3u", "--no-album"}), table);
    EXPECT_THAT(succeed({"loudness", "album.cue", "10.wav", "--target=-3"}),
                HasSubstr("   -9.0    0.0   -6.0    +6.0     +5.0  album.cue, track 2\n"));
    folder.write("mix.xml",
                 "<P><Tracks><Track><SourceEndTime>4</SourceEndTime><Uri>10.wav</Uri></Track></Tracks></P>");
    EXPECT_THAT(succeed({"loudness", "mix.xml"}),
                HasSubstr("   -6.0    0.0   -6.0   -12.0        -  mix.xml\n"));
    const auto all = measure({".", "-j", "3"});
    EXPECT_NEAR(all.at("album")["integrated"], -9.03, 0.1) << "the quiet file is below the gate";
    EXPECT_EQ(all.at("album")["files"], 3);
    EXPECT_TRUE(all.at("./silent.wav")["gain"].is_null());
}

TEST_F(LoudnessCommand, FilesOfFoldersAreOrderedByTheirNumbers) {
    const std::vector<std::string> names{"0",  "00", "01", "1",     "1x", "2",  "9",    "10", "10a", "21",
                                         "22", "A",  "a",  "a.wav", "a1", "a2", "a02b", "B",  "b"};
    std::filesystem::create_directories(folder / "in/below.wav");
    for (const std::string& name : names) folder.write("in/" + name + ".wav", "");
    folder.write("in/below.wav/0.WAV", "");
    std::string expected, order;
    for (const std::string& name : names) expected += "in/" + name + ".wav ";
    for (const nlohmann::json& event :
         parseLines(tonewright({"loudness", "in", "-r", "-j", "1", "--json"}).out))
        if (event["event"] == "start") order += event["input"].get<std::string>() + " ";
    EXPECT_EQ(order, expected + "in/below.wav/0.WAV ");
}

TEST_F(LoudnessCommand, StoresGainsForPlayers) {
    write("a.wav", makeTone(48000, 1, 16, 2, 1000));
    peer({"ffmpeg", "-v", "error", "-i", "a.wav", "-c:a", "libopus", "c.opus"});
    succeed({"convert", "a.wav", "-o", "a.flac"});
    succeed({"convert", "a.wav", "-o", "b.mp3"});
    succeed({"loudness", "--tag", "a.flac", "b.mp3", "c.opus"});
    const auto tagsOf = [&](const std::string& file) {
        return peer({"ffprobe", "-v", "error", "-show_entries", "format_tags:stream_tags", file});
    };
    EXPECT_THAT(tagsOf("a.flac"), HasSubstr("TAG:REPLAYGAIN_TRACK_GAIN=-8.98 dB\n"));
    EXPECT_THAT(tagsOf("b.mp3"), HasSubstr("TAG:REPLAYGAIN_ALBUM_GAIN=-"));
    EXPECT_THAT(tagsOf("c.opus"), testing::ContainsRegex("TAG:R128_TRACK_GAIN=-35[0-9][0-9]\n"));
    const std::string before = readFile(folder / "a.flac");
    EXPECT_THAT(fail({"loudness", "--tag", "a.flac", "missing.flac"}), HasSubstr("missing.flac: "));
    EXPECT_EQ(readFile(folder / "a.flac"), before) << "the same gain, and no album";
    folder.write("one.cue", "FILE a.wav WAVE\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n");
    EXPECT_EQ(fail({"loudness", "--tag", "one.cue"}),
              "tonewright: one.cue: Has no tag that could be changed\n");
}

TEST_F(LoudnessCommand, GoesOnAfterFilesThatFail) {
    write("good.wav", makeTone(44100, 2, 16, 1));
    folder.write("bad.flac", "no sound");
    folder.write("list.m3u", "missing.wav\n");
    const SProcessResult result = tonewright({"loudness", "bad.flac", "list.m3u", "good.wav", "none.wav"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(std::count(result.out.begin(), result.out.end(), '\n'), 2) << result.out;
    for (const char* name : {"bad.flac: ", "missing.wav: ", "none.wav: "})
        EXPECT_THAT(result.err, HasSubstr(std::string("tonewright: ") + name));
    for (const char* target : {"3", "-71", "nan", "loud"})
        EXPECT_EQ(tonewright({"loudness", "good.wav", std::string("--target=") + target}).exitCode, 2);
    EXPECT_EQ(tonewright({"loudness", "-", "-"}).exitCode, 2);
}
