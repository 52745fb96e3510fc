#include "discio2/DiscSupport.h"
#include "host/Program.h"

#include <chrono>
#include <thread>

using namespace tests;

namespace {

class Burn : public CProgramTest {
protected:
    std::string decode(const std::string& name) {
        return peer({"sox", name, "-t", "raw", "-e", "signed", "-b", "16", "-L", "-"});
    }
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
        EXPECT_NE(sheet.find(text), std::string::npos) << sheet;
    const std::string shown = succeed({"disc", "disc.cue"});
    for (const char* text : {"Die Platte", "Ein Lied", "Band"})
        EXPECT_NE(shown.find(text), std::string::npos) << shown;
    folder.write("3.raw", disc.readSegment(2));
    const std::string heard = run({"sox", "-t", "raw", "-r", "44100", "-c", "2", "-b", "16", "-e", "signed",
                                   "-L", "3.raw", "-n", "remix", "1", "stat"},
                                  folder.path())
                                  .err;
    const size_t frequency = heard.find("frequency:");
    ASSERT_NE(frequency, std::string::npos) << heard;
    EXPECT_NEAR(std::stod(heard.substr(frequency + 10)), 440, 3);
}

TEST_F(Burn, DataImageHoldsTheTree) {
    std::filesystem::create_directories(folder / "in/Über");
    std::filesystem::create_directories(folder / "in/empty");
    folder.write("in/Über/.hidden", "a");
    folder.write("in/Über/" + std::string(90, 'n') + ".txt", "long");
    std::filesystem::create_symlink("../in/Über/.hidden", folder / "in/link");
    folder.write("file.bin", makeSectors(3, 1));
    succeed({"burn", "in", "file.bin", "--image", "disc.iso", "--title", "Titel", "-q"});
    peer({"xorriso", "-osirrox", "on", "-indev", "disc.iso", "-extract", "/", "out"});
    EXPECT_EQ(peer({"diff", "-r", "in", "out/in"}), "");
    EXPECT_EQ(readFile(folder / "out/file.bin"), makeSectors(3, 1));
    EXPECT_TRUE(std::filesystem::is_directory(folder / "out/in/empty"));
    EXPECT_NE(peer({"isoinfo", "-d", "-i", "disc.iso"}).find("Volume id: Titel"), std::string::npos);
}

TEST_F(Burn, FailuresNameTheReasonAndLeaveNothing) {
    folder.write("a.wav", toWave(makeSectors(2, 1)));
    folder.write("bad.wav", "RIFFxxxx");
    folder.write("old.cue", "old");
    std::filesystem::create_directory(folder / "b");
    std::filesystem::create_directory_symlink(".", folder / "b/loop");
    const auto before = list();
    const struct {
        std::vector<std::string> arguments;
        const char* reason;
    } failing[] = {
        {{"a.wav", "bad.wav", "--image", "x.cue"}, "bad.wav: "},
        {{"a.wav", "--image", "old.cue"}, "tonewright: old.cue: The file exists (--force replaces it)"},
        {{"a.wav", "nothing.wav", "--image", "x.iso"}, "nothing.wav: No such file"},
        {{"b", "--image", "x.iso"}, "contains itself"},
        {{"a.wav", "--drive", "/dev/null"}, "There is no such drive"},
        {{"a.wav", "--image", "none/x.cue"}, "none"}};
    for (auto c : failing) {
        c.arguments.insert(c.arguments.begin(), "burn");
        EXPECT_NE(fail(c.arguments).find(c.reason), std::string::npos) << c.reason;
    }
    for (std::vector<std::string> wrong :
         std::vector<std::vector<std::string>>{{"a.wav"},
                                               {"a.wav", "--image", "x.iso", "--gap", "1"},
                                               {"a.wav", "--image", "x.cue", "--data"},
                                               {"a.wav", "--image", "x.cue", "--speed", "4"},
                                               {"a.wav", "--image", "x.wav"},
                                               {"a.wav", "--image", "x.cue", "--drive", "/dev/sr0"}}) {
        wrong.insert(wrong.begin(), "burn");
        EXPECT_EQ(tonewright(wrong).exitCode, 2) << wrong.back();
    }
    EXPECT_EQ(list(), before);
    EXPECT_EQ(readFile(folder / "old.cue"), "old");
    succeed({"burn", "a.wav", "--image", "old.cue", "--force", "-q"});
    EXPECT_EQ(readFile(folder / "old.bin"), makeSectors(2, 1));
}

// In the middle of the writing; the images are too large to be ready before.
TEST_F(Burn, CtrlCLeavesEverythingAsItWas) {
    folder.write("long.wav", toWave("").replace(40, 4, little(uint64_t{3600} * 176400, 4)));
    std::filesystem::resize_file(folder / "long.wav", 44 + uint64_t{3600} * 176400);
    folder.write("old.cue", "old");
    const auto before = list();
    for (const char* image : {"old.cue", "new.iso"}) {
        SCOPED_TRACE(image);
        CProcess process({kProgram, "burn", "long.wav", "--image", image, "--force", "--json"}, folder.path(),
                         programEnvironment());
        const auto due = std::chrono::steady_clock::now() + std::chrono::seconds(60);
        while (process.readOut().find("\"progress\"") == std::string::npos &&
               std::chrono::steady_clock::now() < due)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        process.signal(SIGINT);
        const SProcessResult result = process.wait();
        EXPECT_EQ(result.exitCode, 130) << result.out << result.err;
        EXPECT_EQ(parseLines(result.out).back()["event"], "cancelled");
        EXPECT_EQ(list(), before);
        EXPECT_EQ(readFile(folder / "old.cue"), "old");
    }
}
