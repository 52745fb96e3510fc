#include "host/Program.h"

#include <png.h>

#include <array>
#include <cstdio>
#include <map>

using namespace tests;

namespace {

class Output : public CProgramTest {
protected:
    // Runs the program on a terminal of that width and returns everything shown.
    std::string onTerminal(const std::string& arguments, int columns = 80) {
        const SProcessResult result =
            run({"script", "-qec", "stty cols " + std::to_string(columns) + "; " + kProgram + " " + arguments,
                 "/dev/null"},
                folder.path(), programEnvironment());
        EXPECT_EQ(result.exitCode, 0) << result.out;
        return result.out;
    }
};

class Waveform : public CProgramTest {
protected:
    struct SPicture {
        png_image header = {};
        std::vector<uint8_t> pixels; // RGB

        // The number of pixels of a rectangle that are neither white nor grey.
        size_t countBlue(int left, int top, int right, int bottom) const {
            size_t count = 0;
            for (int y = top; y < bottom; ++y)
                for (int x = left; x < right; ++x) {
                    const uint8_t* pixel = &pixels[(static_cast<size_t>(y) * header.width + x) * 3];
                    count += pixel[2] > pixel[0] + 40;
                }
            return count;
        }
    };

    SPicture readPicture(const std::string& name) {
        SPicture picture;
        picture.header.version = PNG_IMAGE_VERSION;
        EXPECT_NE(png_image_begin_read_from_file(&picture.header, (folder / name).c_str()), 0);
        picture.header.format = PNG_FORMAT_RGB;
        picture.pixels.resize(PNG_IMAGE_SIZE(picture.header));
        EXPECT_NE(png_image_finish_read(&picture.header, nullptr, picture.pixels.data(), 0, nullptr), 0)
            << picture.header.message;
        return picture;
    }
};

} // namespace

TEST_F(Output, IsEventsWithJSON) {
    write("good.wav", makeTone(44100, 2, 16, 1));
    folder.write("bad.wav", "RIFF");
    const SProcessResult result =
        tonewright({"convert", "bad.wav", "good.wav", "--to", "flac", "--json", "-j", "1"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.err, "");
    std::vector<std::string> order;
    double fraction = 0;
    for (const nlohmann::json& event : parseLines(result.out)) {
        const std::string kind = event["event"], input = event["input"];
        EXPECT_EQ(event["output"], input.substr(0, input.find('.')) + ".flac");
        if (kind == "progress") {
            EXPECT_GE(event["fraction"].get<double>(), fraction);
            fraction = event["fraction"];
            EXPECT_LE(fraction, 1);
            continue;
        }
        order.push_back(kind + " " + input);
        if (kind == "done") {
            EXPECT_EQ(event["codec"], "FLAC");
            EXPECT_NEAR(event["duration"].get<double>(), 1, 1e-9);
            EXPECT_GT(event["seconds"].get<double>(), 0);
            EXPECT_EQ(event["bytes"], std::filesystem::file_size(folder / "good.flac"));
        } else if (kind == "error") {
            EXPECT_NE(event["message"], "");
        }
    }
    EXPECT_EQ(order, (std::vector<std::string>{"start bad.wav", "error bad.wav", "start good.wav",
                                               "done good.wav"}));
    EXPECT_EQ(list(), (std::set<std::string>{"bad.wav", "good.wav", "good.flac"}));
}

TEST_F(Output, IsALineForEachFileAndNothingMore) {
    write("a.wav", makeTone(8000, 1, 16, 90));
    const std::string line = succeed({"convert", "a.wav", "-o", "a.flac"});
    EXPECT_EQ(line.find("a.flac: FLAC, 1:30.0, "), 0u) << line;
    EXPECT_EQ(std::count(line.begin(), line.end(), '\n'), 1) << line;
    EXPECT_EQ(succeed({"convert", "a.wav", "-q", "-o", "quiet.flac"}), "");
}

TEST_F(Output, HasABarOnATerminalOnly) {
    // Ten minutes of silence, long enough for the bar to grow
    folder.write("a.wav", makeWavHeader({}, 600 * 176400));
    std::filesystem::resize_file(folder / "a.wav", 44 + 600 * 176400);
    const std::string shown = onTerminal("convert a.wav -o a.flac");
    EXPECT_TRUE(has(shown, "[#"));
    EXPECT_TRUE(has(shown, " %"));
    // Erased before the final line
    EXPECT_LT(shown.rfind("\x1b[2K"), shown.find("a.flac: FLAC")) << shown;
    EXPECT_EQ(onTerminal("convert -q a.wav -o quiet.flac"), "");
    EXPECT_FALSE(has(onTerminal("convert --json a.wav -o json.flac"), "\x1b"));
}

TEST_F(Output, HasABarThatFitsTheTerminal) {
    const std::string name =
        "\xff\xfe\xcd\xb8\xe9\x9f\xb3\xe9\x9f\xb3 and a very long name.wav"; // wide, unassigned, invalid
    folder.write(name, makeWavHeader({}, 300 * 176400));
    std::filesystem::resize_file(folder / name, 44 + 300 * 176400);
    for (const int columns : {5, 20, 40, 60, 0}) { // 0: the width is unknown
        std::string shown = onTerminal("convert '" + name + "' -f -o a.flac", columns);
        shown.resize(shown.find("a.flac: FLAC"));
        for (size_t at; (at = shown.find('\x1b')) != std::string::npos;)
            shown.erase(at, shown.find_first_of("AK", at) + 1 - at);
        std::istringstream lines(shown);
        size_t count = 0;
        for (std::string line; std::getline(lines, line); ++count) {
            line.erase(line.find_last_not_of('\r') + 1);
            size_t wide = 0, more = 0;
            for (const char byte : line) wide += byte == '\xe9', more += (byte & 0xC0) == 0x80;
            EXPECT_LT(line.size() - more + wide, static_cast<size_t>(columns > 0 ? columns : 80)) << line;
            EXPECT_TRUE(has(line, "%"));
        }
        EXPECT_GT(count, 0u) << columns;
    }
}

TEST_F(Output, TakesOptionsOfTheProgramAnywhere) {
    write("a.wav", makeTone(8000, 1, 16, 0.1));
    const SProcessResult loud = tonewright({"convert", "a.wav", "-o", "b.flac", "--log-level", "debug"});
    EXPECT_EQ(loud.exitCode, 0);
    EXPECT_NE(loud.err, "");
}

TEST_F(Output, TellsWhatFilesHold) {
    const std::map<std::string, SSound> sounds = {{"a.wav", makeTone(96000, 6, 24, 0.5)},
                                                  {"b.flac", makeTone(44100, 1, 16, 1.5)},
                                                  {"c.ogg", makeTone(48000, 2, 16, 0.75)},
                                                  {"d.mp3", makeTone(22050, 2, 16, 1)}};
    std::vector<std::string> command{"info"};
    for (const auto& [name, sound] : sounds) {
        write("in.wav", sound);
        succeed({"convert", "in.wav", "-o", name});
        command.push_back(name);
    }
    const std::string table = succeed(command);
    EXPECT_EQ(std::count(table.begin(), table.end(), '\n'), 5) << table;
    const std::string start =
        "   duration    rate channels  bits   bit rate       size  codec                 file\n"
        "     0:00.5   96000        6    24 13826 kbit/s   864.1 kB  PCM signed 24 bit     a.wav\n";
    EXPECT_EQ(table.substr(0, start.size()), start);
    command.insert(command.end(), {"--json", "missing.wav"});
    const SProcessResult result = tonewright(command);
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.err, "");
    const std::vector<nlohmann::json> lines = parseLines(result.out);
    ASSERT_EQ(lines.size(), 5u);
    EXPECT_EQ(lines[4]["file"], "missing.wav");
    EXPECT_EQ(lines[4]["error"], "No such file or directory");
    static constexpr const char* kCodecs[] = {"PCM signed 24 bit", "FLAC", "Vorbis", "MPEG audio layer III"};
    size_t i = 0;
    for (const auto& [name, sound] : sounds) {
        const nlohmann::json& line = lines[i];
        EXPECT_EQ(line["file"], name);
        EXPECT_EQ(line["codec"], kCodecs[i++]);
        EXPECT_EQ(line["rate"], sound.rate);
        EXPECT_EQ(line["channels"], sound.channels);
        EXPECT_EQ(line["bits"], sound.bits);
        EXPECT_NEAR(line["duration"].get<double>(), sound.seconds(), name == "d.mp3" ? 0.06 : 1e-6);
        EXPECT_EQ(line["bytes"], std::filesystem::file_size(folder / name));
        EXPECT_TRUE(has(table, name));
    }
}

TEST_F(Output, HasTheBitRateOfTheSoundAlone) {
    write("in.wav", makeNoise(44100, 2, 16, 88200));
    peer({"ffmpeg", "-v", "error", "-f", "lavfi", "-i", "nullsrc=s=400x400,geq=random(1)*255:128:128",
          "-frames:v", "1", "noise.png"});
    for (const std::string name : {"a.mp3", "a.flac", "a.ogg", "a.wav", "a.aiff"}) {
        SCOPED_TRACE(name);
        succeed({"convert", "in.wav", "-o", name});
        const auto rate = [&] {
            return parseLines(succeed({"info", "--json", name})).at(0)["bit_rate"].get<double>();
        };
        const double before = rate();
        EXPECT_NEAR(before, 4.0 * static_cast<double>(std::filesystem::file_size(folder / name)),
                    before / 50);
        succeed({"tag", "cover", "import", name, "-i", "noise.png"});
        EXPECT_NEAR(rate(), before, before / 10); // the tag has padding
    }
}

// What is listed as written or tagged can be.
TEST_F(Output, ListsWhatIsReadWrittenAndTagged) {
    const nlohmann::json listed = nlohmann::json::parse(succeed({"formats", "--json"}));
    const std::string table = succeed({"formats", "--long"});
    std::string lines = "\n";
    for (const std::string& name : listed["read"].get<std::set<std::string>>()) lines += name + "\n";
    EXPECT_EQ("\n" + succeed({"formats"}), lines);
    for (const char* name : {"wav", "aiff", "au", "caf", "w64", "flac", "ogg", "mp3"})
        EXPECT_TRUE(has(lines, "\n" + std::string(name) + "\n")) << name;
    write("in.wav", makeTone(48000, 2, 16, 0.3));
    for (const std::string& name : listed["read"].get<std::set<std::string>>()) {
        SCOPED_TRACE(name);
        const auto isIn = [&](const char* list) {
            const auto names = listed[list].get<std::set<std::string>>();
            return names.count(name) > 0;
        };
        const SProcessResult result = tonewright({"convert", "in.wav", "-o", "out." + name});
        EXPECT_EQ(result.exitCode == 0, isIn("write")) << result.err;
        const auto mark = [&](const char* list) { return isIn(list) ? "yes" : "-"; };
        const nlohmann::json plugins = listed["plugins"][name];
        EXPECT_EQ(plugins.contains("write"), isIn("write"));
        std::array<char, 128> line;
        std::snprintf(line.data(), line.size(), "\n%-10s %-5s %-5s %-5s %-6s sonora2_", name.c_str(), "yes",
                      mark("write"), mark("tag"), plugins["boxed"].get<bool>() ? "yes" : "-");
        EXPECT_TRUE(has(table, line.data()));
        EXPECT_TRUE(has(table, plugins["read"].get<std::string>()));
        if (!isIn("write")) continue;
        EXPECT_EQ(tonewright({"tag", "set", "--title", "T", "out." + name}).exitCode == 0, isIn("tag"));
    }
}

TEST_F(Output, MissesAPlaceForItsText) {
    write("a.wav", makeTone(8000, 1, 16, 0.1));
    // A reader that has left is no failure.
    EXPECT_EQ(run({"bash", "-c", "\"$0\" info a.wav a.wav > >(:); echo $?", kProgram}, folder.path(),
                  programEnvironment())
                  .out,
              "0\n");
    for (const char* arguments : {"formats", "info a.wav", "info --json a.wav"}) {
        const SProcessResult result =
            run({"sh", "-c", std::string(kProgram) + " " + arguments + " > /dev/full"}, folder.path());
        EXPECT_EQ(result.exitCode, 1);
        EXPECT_EQ(result.err, "tonewright: Standard output cannot be written: No space left on device\n");
    }
}

TEST_F(Output, RefusesWrongArguments) {
    write("a.wav", makeTone(8000, 1, 16, 0.1));
    for (const std::vector<std::string>& command : commands(
             ";convrt a.wav;convert;convert a.wav;convert a.wav -o b.flac --to flac;convert a.wav a.wav -o "
             "b.flac;"
             "convert a.wav -o b.flac --rate fast;convert a.wav -o b.flac --bits 12;convert a.wav -o new/;"
             "convert a.wav -o b.flac --quality nan;convert a.wav -o b.mp3 --bitrate -128k;convert a.wav "
             "--to fl/ac;"
             "convert a.wav -o b.mp3 --bitrate 99999999k;convert a.wav -o b.mp3 --min-bitrate 64k;convert -r "
             ". -o b.flac;"
             "convert a.wav -o b.mp3 --bitrate 64k --min-bitrate 128k;convert a.wav -o b.flac --directory .;"
             "convert a.wav --to flac --skip --force;convert a.wav -o b.flac --name %title%;convert a.wav "
             "--output=;"
             "convert a.wav --to flac --name %titel%;convert a.wav -o b.flac --rate 44.1234k;info;formats "
             "more;"
             "convert a.wav -o b.flac --rate 44.1M;convert a.wav -o b.mp3 --bitrate 192;waveform a.wav;"
             "convert a.wav -o b.mp3 --bitrate 192k --quality 0.5;convert a.wav -o b.flac -q --json;"
             "--log-level shouting formats")) {
        const SProcessResult result = tonewright(command);
        EXPECT_EQ(result.exitCode, 2) << testing::PrintToString(command) << result.err;
        EXPECT_EQ(result.out, "");
        EXPECT_GT(result.err.size(), 10u);
    }
    EXPECT_EQ(tonewright({"convrt\n", "a.wav"}).err,
              "Unknown command: convrt\\x0a\nRun with --help for more information.\n");
    EXPECT_EQ(list(), std::set<std::string>{"a.wav"});
}

TEST_F(Output, MissesTheLibrary) {
    for (const char* library : {"/missing/libtonewright.so", "/dev/null"}) {
        const SProcessResult result =
            run({kProgram, "formats"}, folder.path(), {{"TONEWRIGHT_LIBRARY", library}});
        EXPECT_EQ(result.exitCode, 4);
        EXPECT_EQ(result.err.find("tonewright: cannot load the library: "), 0u) << result.err;
    }
}

TEST_F(Waveform, ShowsWhereSoundIs) {
    // The left channel has sound in its first half only, the right one none.
    SSound sound = makeTone(44100, 2, 16, 2);
    for (size_t frame = 0; frame < sound.frames(); ++frame) {
        char* samples = sound.samples.data() + frame * 4;
        std::fill(samples + (frame < sound.frames() / 2 ? 2 : 0), samples + 4, '\0');
    }
    write("in.wav", sound);
    succeed({"waveform", "in.wav", "-o", "out.png", "--width", "400", "--height", "200"});
    const SPicture picture = readPicture("out.png");
    ASSERT_EQ(picture.header.width, 400u);
    ASSERT_EQ(picture.header.height, 200u);
    // Half of full scale fills half of the strip, minus a margin.
    EXPECT_NEAR(static_cast<double>(picture.countBlue(0, 0, 200, 100)), 200 * 47, 200 * 4);
    EXPECT_LE(picture.countBlue(202, 0, 400, 100), 198u); // a line of silence
    EXPECT_LE(picture.countBlue(0, 100, 400, 200), 400u);
}

TEST_F(Waveform, IsDrawnOfAnyLength) {
    for (int frames : {1, 101, 300000}) {
        SCOPED_TRACE(frames);
        write("in.wav", makeNoise(44100, 1, 16, static_cast<size_t>(frames)));
        succeed({"waveform", "in.wav", "-f", "-o", "out.png"});
        const SPicture picture = readPicture("out.png");
        EXPECT_EQ(picture.header.width, 1200u);
        EXPECT_EQ(picture.header.height, 300u);
        if (frames < 300000) continue;
        // Full-scale noise reaches the end; the library drops at most the last 100 steps.
        EXPECT_GT(picture.countBlue(0, 0, 1170, 300), 1170u * 300 * 8 / 10);
        EXPECT_GT(picture.countBlue(1150, 0, 1175, 300), 100u);
    }
}
