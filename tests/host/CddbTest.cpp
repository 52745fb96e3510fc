// Look-ups of discs.
#include "discio2/DiscSupport.h"
#include "freedb/CddbServer.h"
#include "host/Network.h"
#include "host/Terminal.h"

using namespace tests;

namespace {

const std::string kExact =
    "150,17827,33215,50640,67577,84975,102092,122040,139720,158045,172832,189270,207105";
const std::string kSeveral = "183 18000 36049 54999 70000";
const std::string kSimilar = "2400,20000,41000,60030";

class Cddb : public CNetworkTest {
protected:
    // An image whose table of contents is 183, 18000, 36049, 54999 and 70000. Its samples are silence.
    void writeImage() {
        folder.write("disc.bin", "");
        std::filesystem::resize_file(folder / "disc.bin", (70000 - 150) * kSectorBytes);
        folder.write("disc.cue", "TITLE Own\nFILE disc.bin BINARY\nTRACK 01 AUDIO\nTITLE \"Own title\"\n"
                                 "INDEX 00 00:00:00\nINDEX 01 00:00:33\nTRACK 02 AUDIO\nINDEX 01 03:58:00\n"
                                 "TRACK 03 AUDIO\nINDEX 01 07:58:49\nTRACK 04 AUDIO\nINDEX 01 12:11:24\n");
    }
    std::string getTags(const std::string& name) { return peer({"metaflac", "--export-tags-to=-", name}); }
};

} // namespace

TEST_F(Cddb, PrintsRecords) {
    const CCddbServer server;
    const std::string address = server.getAddress();
    const SProcessResult text = tonewright({"cddb", "--toc", kExact, "--server", address});
    EXPECT_EQ(text.exitCode, 0) << text.err;
    EXPECT_EQ(
        text.out.find("Artist  The Tones\nAlbum   Twelve Pieces\nYear    1999\nGenre   Rock\nRecorded in "),
        0u)
        << text.out;
    EXPECT_TRUE(has(text.out, "\n  1  Stück 1\n     live\n  2  Stück 2\n"));
    const auto json =
        nlohmann::json::parse(tonewright({"cddb", "--toc", kSeveral, "--server",
                                          "http://" + address + "/~cddb/cddb.cgi", "--pick", "2", "--json"})
                                  .out);
    EXPECT_EQ(json["id"], "2103a304");
    EXPECT_EQ(json["match"], "exact");
    EXPECT_EQ(json["tracks"][1],
              nlohmann::json({{"number", 2}, {"artist", "Y"}, {"title", "Second"}, {"notes", ""}}));

    const SProcessResult several = tonewright({"cddb", "--toc", kSeveral, "--server", address});
    EXPECT_EQ(several.exitCode, 1);
    EXPECT_EQ(several.out, "  1  rock        2103a304  A / One\n  2  misc        2103a304  A / Other\n");
    EXPECT_EQ(several.err, "tonewright: Several records fit the disc; --pick chooses one by its number\n");
    const SProcessResult listed =
        tonewright({"cddb", "--toc", kSimilar, "--server", address, "--list", "--json"});
    EXPECT_EQ(listed.exitCode, 0) << listed.err;
    EXPECT_EQ(nlohmann::json::parse(listed.out)["candidates"].size(), 2u);
    const SProcessResult none = tonewright({"cddb", "--toc", "0 13650", "--server", address, "--json"});
    EXPECT_EQ(none.exitCode, 1);
    EXPECT_EQ(nlohmann::json::parse(none.out),
              (nlohmann::json{{"id", "0000b601"}, {"toc", {0}}, {"lead_out", 13650}, {"match", "none"}}));
    EXPECT_EQ(tonewright({"cddb", "none.cue", "--server", address, "--json"}).out,
              "{\"error\":\"No such file or directory\"}\n");

    // A stored answer needs no server.
    const std::string asked = server.getCommands();
    EXPECT_EQ(tonewright({"cddb", "--toc", kExact, "--server", address}).out, text.out);
    EXPECT_EQ(server.getCommands(), asked);
    EXPECT_EQ(tonewright({"cddb", "--toc", kExact, "--server", address, "--refresh"}).out, text.out);
    EXPECT_NE(server.getCommands(), asked);
    EXPECT_EQ(list().count("cache/tonewright/cddb/"), 1u);
}

TEST_F(Cddb, ReadsCueSheets) {
    const CCddbServer server;
    write("a.wav", makeTone(75, 1, 8, (36049 - 150) / 75.0));
    write("b.wav", makeTone(75, 1, 8, (70000 - 36049) / 75.0));
    folder.write("disc.cue",
                 "FILE a.wav WAVE\nTRACK 01 AUDIO\nINDEX 00 00:00:00\nINDEX 01 00:00:33\nTRACK 02 AUDIO\n"
                 "INDEX 01 03:58:00\nFILE b.wav WAVE\nTRACK 03 AUDIO\nINDEX 01 00:00:00\nTRACK 04 AUDIO\n"
                 "INDEX 01 04:12:50\n");
    const SProcessResult result =
        tonewright({"cddb", "disc.cue", "--server", server.getAddress(), "--list", "--json"});
    EXPECT_EQ(nlohmann::json::parse(result.out)["toc"], nlohmann::json({183, 18000, 36049, 54999}))
        << result.err;
    EXPECT_EQ(nlohmann::json::parse(result.out)["id"], "2103a304");
}

TEST_F(Cddb, ReportsFailures) {
    const CCddbServer server;
    const std::string address = server.getAddress();
    std::string many = "0"; // 99 tracks
    for (int i = 1; i <= 99; ++i) many += "," + std::to_string(i);
    const struct {
        std::string arguments;
        int code;
        const char* reason;
    } cases[] = {
        {"--toc 150,13650", 1, "tonewright: No record fits the disc 0200b401\n"},
        {"--toc " + many, 1, "tonewright: No record fits the disc "},
        {"--toc " + kExact + " --server " + address + "/code/530", 1,
         "tonewright: The server returned an error message (code 530)\n"},
        {"--toc " + kExact + " --server name.invalid", 1,
         "tonewright: The internet music database server could not be located\n"},
        {"--toc " + kSimilar + " --pick 3", 1, "tonewright: There are only 2 records\n"},
        {"--toc " + kSimilar + " --pick 1", 1,
         "tonewright: The server returned an error message (code 401)\n"},
        {"none.cue", 1, "tonewright: none.cue: No such file or directory\n"},
        {"disc.iso", 1, "tonewright: disc.iso: "},
        {"--toc 150,x,3", 2, "x is not a number of frames"},
        {"--toc=-1,3", 2, "-1 is not a number of frames"},
        {"--toc 150x,300", 2, "150x is not a number of frames"},
        {"--toc 150,150", 2, "must ascend"},
        {"--toc 150", 2, "needs a track and the lead-out"},
        {"--toc " + many + ",100", 2, "has more than 99 tracks"},
        {"--toc 150,300 --server=", 2, "--server"},
        {"--toc 150,300 --server a:b", 2, "HOST"},
        {"--toc 150,300 disc.cue", 2, "--toc"},
    };
    for (const auto& each : cases) {
        std::vector<std::string> command = with({"cddb"}, words(each.arguments));
        if (each.arguments.find("--server") == std::string::npos)
            command = with(command, {"--server", address});
        const SProcessResult result = tonewright(command);
        EXPECT_EQ(result.exitCode, each.code) << each.reason;
        EXPECT_TRUE(has(result.err, each.reason));
    }
}

TEST_F(Cddb, NamesRippedTracks) {
    const CCddbServer server;
    const std::string address = server.getAddress();
    writeImage();
    for (const char* place : {"disc.cue", ""}) { // the latter is the folder as a drive
        const CEnvironment folders("TONEWRIGHT_DRIVE_FOLDERS", folder.path().string());
        const SProcessResult result = tonewright(
            {"cddb", *place ? place : folder.path().string(), "--server", address, "--list", "--json"});
        EXPECT_EQ(nlohmann::json::parse(result.out)["id"], "2103a304") << place << result.err;
    }
    const auto rip = [&](const std::vector<std::string>& options) {
        return tonewright(with({"rip", "disc.cue", "-d", "out", "-q"}, options));
    };
    const SProcessResult open = rip({"--cddb", "--server", address});
    EXPECT_EQ(open.exitCode, 1);
    EXPECT_EQ(open.err, "  1  rock        2103a304  A / One\n  2  misc        2103a304  A / Other\n"
                        "tonewright: Several records fit the disc; --pick chooses one by its number\n");
    EXPECT_EQ(rip({"--cddb", "--server", address, "--pick", "3"}).err,
              "tonewright: There are only 2 records\n");
    EXPECT_EQ(rip({"--cddb", "--server", "name.invalid"}).exitCode, 1);
    EXPECT_EQ(rip({"--cddb"}).exitCode, 2);
    EXPECT_EQ(rip({"--server", address}).exitCode, 2);
    EXPECT_FALSE(std::filesystem::exists(folder / "out"));
    const SProcessResult done = rip({"--cddb", "--server", address, "--pick", "2", "--cue", "--pattern",
                                     "%album-artist%/%track% %artist% - %title%"});
    EXPECT_EQ(done.exitCode, 0) << done.err;
    const std::string tags = getTags("out/Various/01 X - First.flac");
    for (const char* field : {"TITLE=First\n", "ARTIST=X\n", "ALBUM=Other\n", "ALBUMARTIST=Various\n"})
        EXPECT_TRUE(has(tags, field));
    EXPECT_EQ(list().count("out/Various/04 Various - Fourth.flac"), 1u);
    EXPECT_TRUE(has(readFile(folder / "out/Other.cue"), "TITLE \"First\"\n    PERFORMER \"X\""));
}

// The question on a terminal, with answers that are no numbers of records, and Ctrl-C.
TEST_F(Cddb, AsksOnATerminal) {
    const CCddbServer server;
    const struct {
        const char* keys;
        int code;
        const char* shown;
    } cases[] = {{"0\n3\nx\n2\n", 0, "Z - Third"}, {"\n", 1, ""}, {"\4", 1, ""}, {"1\3", 130, ""}};
    for (const auto& each : cases) {
        CTerminal terminal({"timeout", "--foreground", "-s", "KILL", "60", kProgram, "cddb", "--toc",
                            kSeveral, "--server", server.getAddress()},
                           CTerminal::EOutput::terminal, folder.path(), programEnvironment());
        size_t asked = 0; // up to here
        const auto waitForQuestion = [&] {
            const std::string question = "Number (empty for none): ";
            size_t at = std::string::npos;
            waitUntil([&] {
                at = terminal.getScreen().find(question, asked);
                return at != std::string::npos || !terminal.getProcess().isRunning();
            });
            asked = at == std::string::npos ? at : at + question.size();
        };
        waitForQuestion();
        ASSERT_NE(asked, std::string::npos) << terminal.getScreen();
        for (const char* key = each.keys; *key; ++key) {
            terminal.type(*key);
            if (*key == '\n' && key[1]) waitForQuestion();
        }
        EXPECT_EQ(terminal.getProcess().wait().exitCode, each.code) << each.keys;
        EXPECT_TRUE(has(terminal.getScreen(), each.shown));
        EXPECT_TRUE(terminal.isInUsualMode());
    }
}

TEST_F(Cddb, CtrlCEndsALookUp) {
    const CSilentServer silent;
    writeImage();
    CProcess ripping({"timeout", "--foreground", "-s", "KILL", "60", kProgram, "rip", "disc.cue", "--cddb",
                      "--server", silent.getAddress()},
                     folder.path(), programEnvironment());
    silent.waitForRequest();
    ripping.signal(SIGINT);
    EXPECT_EQ(ripping.wait().exitCode, 130);
    EXPECT_EQ(list(), (std::set<std::string>{"cache/", "disc.bin", "disc.cue", "tmp/"}));
}
