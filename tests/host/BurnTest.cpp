#include "discio2/DiscSupport.h"
#include "host/Program.h"

#include <sys/stat.h>

using namespace tests;

namespace {

class Burn : public CProgramTest {
protected:
    std::string padded(std::string pcm) {
        pcm.resize((pcm.size() + kSectorBytes - 1) / kSectorBytes * kSectorBytes);
        return pcm;
    }
};

} // namespace

TEST_F(Burn, AudioImageHoldsSamplesGapsAndTexts) {
    folder.write("1.wav", toWave(makeSectors(3, 1).substr(0, 6000)));
    folder.write("2.wav", toWave(makeSectors(4, 2)));
    peer({"flac", "-s", "-T", "TITLE=Ein Lied", "-T", "ARTIST=Band", "-T", "ALBUM=Platte", "-T",
          "ISRC=DE-ABC-26-00001", "2.wav", "-o", "2.flac"});
    peer({"sox", "-r", "48000", "-n", "-b", "24", "-c", "1", "3.wav", "synth", "1", "sine", "440"});
    const auto lines = parseLines(succeed({"burn", "1.wav", "2.flac", "3.wav", "--image", "disc.cue", "--gap",
                                           "0.04", "--cd-text", "--title", "Die Platte", "--json"}));
    EXPECT_EQ(lines.back()["event"], "done");
    EXPECT_EQ(lines.back()["tracks"], 3);
    const SOpenDisc disc((folder / "disc.cue").string());
    EXPECT_TRUE(disc.readSegment(0) == padded(decode("1.wav")));
    EXPECT_TRUE(disc.readSegment(1) == decode("2.wav"));
    EXPECT_EQ(disc.describe(), "0+3-150 6+4-3 13+75-3 | 88");
    const std::string sheet = peer({"cdrdao", "show-toc", "disc.cue"});
    for (const char* text : {"TRACK  3  Mode AUDIO", "ISRC DE ABC 26 00001", "START  00:00:13"})
        EXPECT_TRUE(has(sheet, text));
    const std::string shown = succeed({"disc", "disc.cue"});
    for (const char* text : {"Die Platte", "Ein Lied", "Band"}) EXPECT_TRUE(has(shown, text));
    folder.write("3.raw", disc.readSegment(2));
    const std::string heard = run({"sox", "-t", "raw", "-r", "44100", "-c", "2", "-b", "16", "-e", "signed",
                                   "-L", "3.raw", "-n", "remix", "1", "stat"},
                                  folder.path())
                                  .err;
    const size_t frequency = heard.find("frequency:");
    ASSERT_NE(frequency, std::string::npos) << heard;
    EXPECT_NEAR(std::stod(heard.substr(frequency + 10)), 440, 3);

    // What all tracks have in common, cut to what fits.
    const std::string title = "T\t" + std::string(157, 'x'), rest = "\xf0\x9f\x8e\xb5";
    for (const char* name : {"2.flac", "4.flac"}) {
        peer({"flac", "-s", "-f", "2.wav", "-o", name});
        succeed({"tag", "set", name, "--album", title + rest, "--artist", name, "--album-artist", "All"});
    }
    const std::string burnt =
        succeed({"burn", "2.flac", "4.flac", "--image", "both.cue", "--cd-text", "--gap", "0.0134"});
    EXPECT_EQ(burnt, "both.cue: audio CD, 2 tracks, 0:00.1\n");
    nlohmann::json told = parseLines(succeed({"disc", "both.cue", "--json"})).at(0);
    EXPECT_EQ(told["title"], "T " + title.substr(2));
    EXPECT_EQ(told["performer"], "All");
    EXPECT_EQ(SOpenDisc((folder / "both.cue").string()).describe(), "0+4-150 5+4-1 | 9");
    succeed({"tag", "set", "4.flac", "--album", "B", "--album-artist", ""});
    succeed({"burn", "2.flac", "4.flac", "--image", "both.cue", "--cd-text", "-f"});
    told = parseLines(succeed({"disc", "both.cue", "--json"})).at(0);
    EXPECT_EQ(told["title"].get<std::string>() + told["performer"].get<std::string>(), "");

    // RF64 files cannot have a tag.
    succeed({"convert", "1.wav", "-o", "wide.rf64"});
    std::filesystem::rename(folder / "wide.rf64", folder / "wide.wav");
    EXPECT_EQ(tonewright({"burn", "wide.wav", "--image", "wide.cue", "--cd-text"}).err,
              "tonewright: wide.cue: wide.wav: No tag is known for RF64 files\n");
}

TEST_F(Burn, DataImageHoldsTheTree) {
    std::filesystem::create_directories(folder / "in/Über");
    std::filesystem::create_directories(folder / "in/empty");
    folder.write("in/Über/.hidden", "a");
    folder.write("in/Über/" + std::string(90, 'n') + ".txt", "long");
    std::filesystem::create_symlink("../in/Über/.hidden", folder / "in/link");
    folder.write("file.bin", makeSectors(3, 1));
    EXPECT_EQ(succeed({"burn", "in", "file.bin", "--image", "disc.iso", "--title", "Titel"}),
              "disc.iso: data disc, 4 files, 7.1 kB\n");
    peer({"xorriso", "-osirrox", "on", "-indev", "disc.iso", "-extract", "/", "out"});
    EXPECT_EQ(peer({"diff", "-r", "in", "out/in"}), "");
    EXPECT_EQ(readFile(folder / "out/file.bin"), makeSectors(3, 1));
    EXPECT_TRUE(std::filesystem::is_directory(folder / "out/in/empty"));
    EXPECT_TRUE(has(peer({"isoinfo", "-d", "-i", "disc.iso"}), "Volume id: Titel"));
    // Otherwise the title is the name of the folder or of the image.
    std::filesystem::remove(folder / "in/link");
    const std::string longest = "thirty-one bytes and a half: iii";
    std::filesystem::rename(folder / "in", folder / (longest + "\xc3\x9c"));
    for (const auto& [input, name] : {std::pair{longest + "\xc3\x9c", longest}, {"file.bin", "disc"}}) {
        succeed({"burn", input, "--image", "disc.iso", "-f", "-q"});
        EXPECT_EQ(parseLines(succeed({"disc", "disc.iso", "--json"})).at(0)["title"], name);
    }
}

TEST_F(Burn, FailuresNameTheReasonAndLeaveNothing) {
    folder.write("a.wav", toWave(makeSectors(2, 1)));
    folder.write("bad.wav", "RIFFxxxx");
    folder.write("old.cue", "old");
    folder.write("older.bin", "old");
    ASSERT_EQ(::mkfifo((folder / "pipe").c_str(), 0600), 0);
    std::filesystem::create_directory(folder / "b");
    std::filesystem::create_directory_symlink(".", folder / "b/loop");
    const auto before = list();
    const std::pair<const char*, const char*> failing[] = {
        {"a.wav bad.wav --image x.cue", "bad.wav: "},
        {"a.wav --image old.cue", "tonewright: old.cue: The file exists (--force replaces it)"},
        {"a.wav --image older.cue", "older.cue: older.bin exists (--force replaces it)"},
        {"old.cue -f --image ./old.cue", "Input and output are the same file"},
        {"a.wav nothing.wav --image x.iso", "nothing.wav: No such file"},
        {"a.wav a.wav --image x.iso", "a.wav: The specified object already exists"},
        {"pipe --image x.iso", "x.iso: pipe: Is not a regular file"},
        {"b --image x.iso", "contains itself"},
        {"a.wav --drive /dev/null", "There is no such drive"},
        {"a.wav --image none/x.cue", "none"}};
    for (const auto& [arguments, reason] : failing)
        EXPECT_TRUE(has(fail(with({"burn"}, words(arguments))), reason));
    for (const char* wrong : {"", "--image x.iso --gap 1", "--image x.cue --data", "--image x.iso --audio",
                              "--image x.iso --cd-text", "--image x.cue --title x", "--image x.cue --speed 4",
                              "--image x.wav", "--image x.cue --drive /dev/sr0"})
        EXPECT_EQ(tonewright(with({"burn", "a.wav"}, words(wrong))).exitCode, 2) << wrong;
    EXPECT_EQ(list(), before);
    EXPECT_EQ(readFile(folder / "old.cue"), "old");
    EXPECT_TRUE(has(succeed({"burn", "a.wav", "--image", "old.cue", "--force"}), "CD, 1 track, "));
    EXPECT_EQ(readFile(folder / "old.bin"), makeSectors(2, 1));

    std::vector<std::string> command =
        with({"burn", "--image", "many.cue"}, std::vector<std::string>(100, "a.wav"));
    EXPECT_TRUE(has(fail(command), "at most 99 tracks, not 100"));
    command.pop_back();
    EXPECT_TRUE(has(succeed(command), "CD, 99 tracks, "));
}
