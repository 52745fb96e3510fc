#include "discio2/DiscSupport.h"
#include "host/Program.h"
#include "support/Environment.h"

using namespace tests;

namespace {

class Rip : public CProgramTest {
protected:
    Rip() {
        folder.write("a.bin", a + b);
        folder.write("disc.cue", "TITLE \"The disc\"\nPERFORMER Band\nCATALOG 1234567890123\nFILE a.bin "
                                 "BINARY\n  TRACK 01 AUDIO\n    TITLE \"One/Two\"\n"
                                 "    INDEX 01 00:00:00\n  TRACK 02 AUDIO\n    ISRC DEABC2600001\n    INDEX "
                                 "00 00:00:30\n    INDEX 01 00:00:32\n");
    }
    std::string computeCrc(const std::string& bytes) { // by another program
        folder.write("crc.raw", bytes);
        return peer({"/usr/bin/python3", "-c",
                     "import zlib; print('%08X' % zlib.crc32(open('crc.raw','rb').read()), end='')"});
    }

    std::string a = makeSectors(32, 1), b = makeSectors(40, 2);
};

} // namespace

TEST_F(Rip, FilesHoldTheExactSamplesTextsAndReports) {
    const auto lines = parseLines(succeed({"rip", "disc.cue", "-d", "out", "--verify", "--cue", "--json"}));
    EXPECT_TRUE(decode("out/01 One-Two.flac") == a) << "with the pregap of track 2";
    EXPECT_TRUE(decode("out/02 Track 2.flac") == b);
    for (const char* field : {"TITLE=One/Two\n", "ALBUM=The disc\n", "ARTIST=Band\n", "TRACKNUMBER=1\n"})
        EXPECT_TRUE(has(peer({"metaflac", "--export-tags-to=-", "out/01 One-Two.flac"}), field));
    EXPECT_EQ(peer({"metaflac", "--show-tag=TITLE", "out/02 Track 2.flac"}), "") << "none is made up";
    const auto line = std::ranges::find_if(
        lines, [](const auto& each) { return each["event"] == "ripped" && each["track"] == 2; });
    ASSERT_NE(line, lines.end());
    EXPECT_EQ((*line)["crc32"], computeCrc(b));
    EXPECT_EQ((*line)["frames"], 40 * 588);
    EXPECT_NEAR((*line)["duration"], 40 / 75.0, 1e-9);
    EXPECT_NEAR((*line)["peak"], 1, 1e-3);
    EXPECT_EQ((*line)["repairs"], 0);
    EXPECT_EQ((*line)["verified"], true);
    EXPECT_EQ(
        readFile(folder / "out/The disc.cue"),
        "TITLE \"The disc\"\nPERFORMER \"Band\"\nCATALOG 1234567890123\n"
        "FILE \"01 One-Two.flac\" WAVE\n  TRACK 01 AUDIO\n    TITLE \"One/Two\"\n    INDEX 01 00:00:00\n"
        "  TRACK 02 AUDIO\n    ISRC DEABC2600001\n    INDEX 00 00:00:30\nFILE \"02 Track 2.flac\" WAVE\n    "
        "INDEX 01 00:00:00\n");
}

// The files and the cue sheet describe the same disc again.
TEST_F(Rip, ACueSheetKeepsPregapsAndTheSoundBeforeTrack1) {
    folder.write("b.bin", makeSectors(300, 4));
    folder.write("gaps.cue",
                 "TITLE gaps\nFILE b.bin BINARY\nTRACK 01 AUDIO\nINDEX 00 00:00:00\nINDEX 01 00:02:20\n"
                 "TRACK 02 AUDIO\nINDEX 01 00:02:70\nTRACK 03 AUDIO\nINDEX 00 00:03:00\nINDEX 01 00:03:10\n");
    succeed({"rip", "gaps.cue", "--to", "wav", "--cue", "-q", "-j", "3", "-d", "out"});
    std::string all;
    for (const char* name :
         {"out/00 Hidden track.wav", "out/01 Track 1.wav", "out/02 Track 2.wav", "out/03 Track 3.wav"})
        all += decode(name);
    const std::string disc = readFile(folder / "b.bin");
    EXPECT_TRUE(all == disc) << all.size() / kSectorBytes;
    const auto before = parseLines(succeed({"disc", "gaps.cue", "--json"}));
    const auto behind = parseLines(succeed({"disc", "out/gaps.cue", "--json"}));
    ASSERT_EQ(before.size(), behind.size());
    for (size_t i = 1; i < before.size(); ++i) EXPECT_EQ(before[i], behind[i]);
    succeed({"rip", "gaps.cue", "0", "--to", "wav", "-q"});
    EXPECT_TRUE(decode("00 Hidden track.wav") == decode("out/00 Hidden track.wav"));
    EXPECT_TRUE(has(fail({"rip", "disc.cue", "0"}), "no sound before track 1"));
    EXPECT_TRUE(has(succeed({"disc", "gaps.cue"}), "\nThere are 2.3 seconds of sound before track 1\n"));
    // A sheet cannot name files with quotation marks. One that exists is reported before the tracks are read.
    const std::vector<std::string> quoted{"rip", "gaps.cue",  "--cue",      "-d",
                                          "out", "--pattern", "\"%track%\""};
    EXPECT_TRUE(has(fail(quoted), "out/gaps.cue exists (--force replaces it)"));
    EXPECT_EQ(list().count("out/'01'.flac"), 0u);
    succeed(with(quoted, {"-q", "-f"}));
    EXPECT_TRUE(has(readFile(folder / "out/gaps.cue"), "FILE \"'01'.flac\" WAVE\n"));
    EXPECT_EQ(list().count("out/'01'.flac"), 1u);
}

TEST_F(Rip, SomeTracksAsOtherTypesWithoutReplacing) {
    succeed({"rip", "disc.cue", "2", "--to", "wav", "--pattern", "%album% %track%", "-q"});
    EXPECT_TRUE(decode("The disc 02.wav") == b);
    EXPECT_TRUE(
        has(fail({"rip", "disc.cue", "--to", "wav", "--pattern", "%album% %track%", "-q"}), "exists"));
    EXPECT_TRUE(std::filesystem::exists(folder / "The disc 01.wav"));
    EXPECT_TRUE(
        has(fail({"rip", "disc.cue", "-f", "--pattern", "%album%"}), "already converted to The disc.flac"));
    folder.write("file", "");
    EXPECT_TRUE(
        has(fail({"rip", "disc.cue", "1", "-d", "file/out"}), "folder file/out cannot be created: Not a"));
    EXPECT_TRUE(has(fail({"rip", "disc.cue", "3"}), "has no audio track 3"));
    EXPECT_TRUE(has(fail({"rip", "nothing.cue"}), "nothing.cue"));
    for (const char* tracks : {"-", "2-x", "2-", "2-1", "-1", "1,,2", "99-100", "1-2-2", "1-2x", "2x"})
        EXPECT_EQ(tonewright({"rip", "disc.cue", tracks}).exitCode, 2) << tracks;
    succeed({"rip", "disc.cue", "2,1-2", "--to", "au", "-q"});
    EXPECT_TRUE(decode("01 One-Two.au") == a.substr(0, 30 * kSectorBytes));
    EXPECT_TRUE(decode("02 Track 2.au") == b);
    EXPECT_EQ(list().count("The disc 02.wav.part"), 0u);
}

TEST_F(Rip, DrivesAndDiscsAreShown) {
    const CEnvironment folders("TONEWRIGHT_DRIVE_FOLDERS", folder.path().string());
    const auto drives = parseLines(succeed({"drives", "--json"}));
    ASSERT_FALSE(drives.empty());
    EXPECT_EQ(drives.back()["drive"], folder.path().string());
    EXPECT_EQ(drives.back()["disc"], "CD-ROM");
    const auto lines = parseLines(succeed({"disc", folder.path().string(), "--json"}));
    ASSERT_EQ(lines.size(), 3u);
    EXPECT_EQ(lines[0]["title"], "The disc");
    EXPECT_EQ(lines[1]["title"], "One/Two");
    EXPECT_EQ(lines[1]["blocks"], 30);
    EXPECT_EQ(lines[2]["pregap"], 2);
    const std::string tracks = "Title: The disc\nPerformer: Band\nCatalogue: 1234567890123\n"
                               "track    duration    start   blocks  pregap  title\n"
                               "    1      0:00.4        0       30     150  One/Two\n"
                               "    2      0:00.5       32       40       2    DEABC2600001\n";
    EXPECT_EQ(succeed({"disc"}), folder.path().string() + ": CD-ROM, 147.5 kB\n" + tracks) << "the only one";
    const std::string ripped = succeed({"rip", "1", "--verify"}),
                      crc = computeCrc(a.substr(0, 30 * kSectorBytes));
    EXPECT_EQ(ripped.substr(ripped.find('\n') + 1),
              "track  1  CRC-32 " + crc + "  0:00.4  0 repaired  peak 100.0 %  verified\n");
    std::filesystem::create_directory(folder / "empty");
    const CEnvironment none("TONEWRIGHT_DRIVE_FOLDERS", (folder / "empty").string());
    EXPECT_EQ(fail({"disc"}), "tonewright: There is no disc in any drive\n");
    EXPECT_TRUE(has(fail({"disc", "/dev/null"}), "neither a drive nor a disc image\n"));
    CProcess watching({kProgram, "drives", "--watch"}, folder.path(), programEnvironment());
    EXPECT_TRUE(waitForLines(watching, 2));
    watching.signal(SIGTERM);
    const SProcessResult watched = watching.wait();
    EXPECT_EQ(watched.out, succeed({"drives"})) << "the list comes first";
    EXPECT_TRUE(has(watched.out, "/empty -  "));
}
