#include "discio2/DiscSupport.h"
#include "host/Program.h"
#include "support/Environment.h"

using namespace tests;

namespace {

class Rip : public CProgramTest {
protected:
    Rip() {
        folder.write("a.bin", a + b);
        folder.write(
            "disc.cue",
            "TITLE \"The disc\"\nPERFORMER Band\nFILE a.bin BINARY\n  TRACK 01 AUDIO\n    TITLE \"One/Two\"\n"
            "    INDEX 01 00:00:00\n  TRACK 02 AUDIO\n    INDEX 00 00:00:30\n    INDEX 01 00:00:32\n");
    }
    // The samples of a file, decoded by another program.
    std::string decode(const std::string& name) {
        return peer({"sox", name, "-t", "raw", "-e", "signed", "-b", "16", "-L", "-"});
    }

    std::string a = makeSectors(32, 1), b = makeSectors(40, 2);
};

} // namespace

TEST_F(Rip, FilesHoldTheExactSamplesTextsAndReports) {
    const auto lines = parseLines(succeed({"rip", "disc.cue", "-d", "out", "--verify", "--cue", "--json"}));
    EXPECT_TRUE(decode("out/01 One-Two.flac") == a) << "with the pregap of track 2";
    EXPECT_TRUE(decode("out/02 Track 2.flac") == b);
    for (const char* field : {"TITLE=One/Two\n", "ALBUM=The disc\n", "ARTIST=Band\n", "TRACKNUMBER=1\n"})
        EXPECT_NE(peer({"metaflac", "--export-tags-to=-", "out/01 One-Two.flac"}).find(field),
                  std::string::npos)
            << field;
    EXPECT_EQ(peer({"metaflac", "--show-tag=TITLE", "out/02 Track 2.flac"}), "") << "none is made up";
    folder.write("b.raw", b);
    const std::string crc = peer(
        {"/usr/bin/python3", "-c", "import zlib; print('%08X' % zlib.crc32(open('b.raw','rb').read()))"});
    bool isReported = false;
    for (const auto& line : lines)
        if (line.value("event", "") == "ripped" && line["track"] == 2) {
            isReported = true;
            EXPECT_EQ(line["crc32"].get<std::string>() + "\n", crc);
            EXPECT_EQ(line["frames"], 40 * 588);
            EXPECT_EQ(line["repairs"], 0);
            EXPECT_EQ(line["verified"], true);
        }
    EXPECT_TRUE(isReported);
    EXPECT_EQ(
        readFile(folder / "out/The disc.cue"),
        "TITLE \"The disc\"\nPERFORMER \"Band\"\n"
        "FILE \"01 One-Two.flac\" WAVE\n  TRACK 01 AUDIO\n    TITLE \"One/Two\"\n    INDEX 01 00:00:00\n"
        "  TRACK 02 AUDIO\n    INDEX 00 00:00:30\nFILE \"02 Track 2.flac\" WAVE\n    INDEX 01 00:00:00\n");
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
    EXPECT_NE(fail({"rip", "disc.cue", "0"}).find("no sound before track 1"), std::string::npos);
}

TEST_F(Rip, SomeTracksAsOtherTypesWithoutReplacing) {
    succeed({"rip", "disc.cue", "2", "--to", "wav", "--pattern", "%album% %track%", "-q"});
    EXPECT_TRUE(decode("The disc 02.wav") == b);
    EXPECT_NE(fail({"rip", "disc.cue", "--to", "wav", "--pattern", "%album% %track%", "-q"}).find("exists"),
              std::string::npos);
    EXPECT_TRUE(std::filesystem::exists(folder / "The disc 01.wav"));
    EXPECT_NE(fail({"rip", "disc.cue", "3"}).find("has no audio track 3"), std::string::npos);
    EXPECT_NE(fail({"rip", "nothing.cue"}).find("nothing.cue"), std::string::npos);
    for (const char* tracks : {"2-x", "2-", "2-1", "-1", "1,,2", "99-100", "1-2-2", "1-2x", "2x"})
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
    EXPECT_NE(succeed({"disc", "disc.cue"}).find("One/Two"), std::string::npos);
}
