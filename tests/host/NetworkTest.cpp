// Look-ups of discs and files on web servers.
#include "freedb/CddbServer.h"
#include "host/Program.h"

#include <fstream>
#include <random>

using namespace tests;

namespace {

const std::string kExact =
    "150 17827 33215 50640 67577 84975 102092 122040 139720 158045 172832 189270 207105";
const std::string kSeveral = "183 18000 36049 54999 70000";
const std::string kSimilar = "2400,20000,41000,60030";

class Network : public CProgramTest {
protected:
    void SetUp() override {
        std::filesystem::create_directory(folder / "cache");
        std::filesystem::create_directory(folder / "tmp");
    }
    // Whatever happens, no temporary file remains.
    void TearDown() override { EXPECT_TRUE(std::filesystem::is_empty(folder / "tmp")); }

    std::vector<std::pair<std::string, std::string>> environment() {
        auto all = programEnvironment();
        all.emplace_back("XDG_CACHE_HOME", folder / "cache");
        all.emplace_back("TMPDIR", folder / "tmp");
        all.emplace_back("http_proxy", "");
        return all;
    }
    SProcessResult call(std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), {"timeout", "-s", "KILL", "60", kProgram});
        return run(arguments, folder.path(), environment());
    }
};

// A web server for the folder "served".
class CWebServer {
public:
    explicit CWebServer(const std::filesystem::path& folder)
        : m_process(
              {"python3", "-u", "-c",
               "import http.server as h, functools, sys\n"
               "s = h.ThreadingHTTPServer(('127.0.0.1', 0), functools.partial(h.SimpleHTTPRequestHandler, "
               "directory=sys.argv[1]))\nprint(s.server_port)\ns.serve_forever()",
               folder}) {
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(30);
        while (m_process.readOut().find('\n') == std::string::npos && m_process.isRunning() &&
               std::chrono::steady_clock::now() < end)
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    std::string getBase() const {
        return "http://127.0.0.1:" + std::to_string(std::atoi(m_process.readOut().c_str())) + "/";
    }

private:
    CProcess m_process;
};

} // namespace

TEST_F(Network, CddbPrintsRecords) {
    const CCddbServer server;
    const std::string address = server.getAddress();
    const SProcessResult text = call({"cddb", "--toc", kExact, "--server", address});
    EXPECT_EQ(text.exitCode, 0) << text.err;
    EXPECT_EQ(
        text.out.find("Artist  The Tones\nAlbum   Twelve Pieces\nYear    1999\nGenre   Rock\nRecorded in "),
        0u)
        << text.out;
    EXPECT_NE(text.out.find("\n  1  Stück 1\n     live\n  2  Stück 2\n"), std::string::npos) << text.out;
    const auto json =
        nlohmann::json::parse(call({"cddb", "--toc", kSeveral, "--server",
                                    "http://" + address + "/~cddb/cddb.cgi", "--pick", "2", "--json"})
                                  .out);
    EXPECT_EQ(json["id"], "2103a304");
    EXPECT_EQ(json["match"], "exact");
    EXPECT_EQ(json["tracks"][1],
              nlohmann::json({{"number", 2}, {"artist", "Y"}, {"title", "Second"}, {"notes", ""}}));

    const SProcessResult several = call({"cddb", "--toc", kSeveral, "--server", address});
    EXPECT_EQ(several.exitCode, 1);
    EXPECT_EQ(several.out, "  1  rock        2103a304  A / One\n  2  misc        2103a304  A / Other\n");
    EXPECT_EQ(several.err, "tonewright: Several records fit the disc; --pick chooses one by its number\n");
    const SProcessResult listed = call({"cddb", "--toc", kSimilar, "--server", address, "--list", "--json"});
    EXPECT_EQ(listed.exitCode, 0) << listed.err;
    EXPECT_EQ(nlohmann::json::parse(listed.out)["candidates"].size(), 2u);

    // A stored answer needs no server.
    const std::string asked = server.getCommands();
    EXPECT_EQ(call({"cddb", "--toc", kExact, "--server", address}).out, text.out);
    EXPECT_EQ(server.getCommands(), asked);
    EXPECT_EQ(call({"cddb", "--toc", kExact, "--server", address, "--refresh"}).out, text.out);
    EXPECT_NE(server.getCommands(), asked);
    EXPECT_EQ(list().count("cache/tonewright/cddb/"), 1u);
}

TEST_F(Network, CddbReadsCueSheets) {
    const CCddbServer server;
    write("a.wav", makeTone(75, 1, 8, (36049 - 150) / 75.0));
    write("b.wav", makeTone(75, 1, 8, (70000 - 36049) / 75.0));
    folder.write("disc.cue",
                 "FILE a.wav WAVE\nTRACK 01 AUDIO\nINDEX 00 00:00:00\nINDEX 01 00:00:33\nTRACK 02 AUDIO\n"
                 "INDEX 01 03:58:00\nFILE b.wav WAVE\nTRACK 03 AUDIO\nINDEX 01 00:00:00\nTRACK 04 AUDIO\n"
                 "INDEX 01 04:12:50\n");
    const SProcessResult result =
        call({"cddb", "disc.cue", "--server", server.getAddress(), "--list", "--json"});
    EXPECT_EQ(nlohmann::json::parse(result.out)["toc"], nlohmann::json({183, 18000, 36049, 54999}))
        << result.err;
    EXPECT_EQ(nlohmann::json::parse(result.out)["id"], "2103a304");
    EXPECT_EQ(call({"cddb", "a.wav", "--server", "x"}).err, "tonewright: a.wav: Is not a cue sheet\n");
}

TEST_F(Network, CddbReportsFailures) {
    const CCddbServer server;
    const std::string address = server.getAddress();
    const struct {
        std::vector<std::string> arguments;
        int code;
        const char* reason;
    } cases[] = {
        {{"--toc", "150 13650", "--server", address}, 1, "tonewright: No record fits the disc 0200b401\n"},
        {{"--toc", kExact, "--server", address + "/code/530"},
         1,
         "tonewright: The server returned an error message (code 530)\n"},
        {{"--toc", kExact, "--server", "name.invalid"},
         1,
         "tonewright: The internet music database server could not be located\n"},
        {{"--toc", kSimilar, "--server", address, "--pick", "3"},
         1,
         "tonewright: There are only 2 records\n"},
        {{"--toc", kSimilar, "--server", address, "--pick", "1"},
         1,
         "tonewright: The server returned an error message (code 401)\n"},
        {{"none.cue", "--server", address}, 1, "tonewright: none.cue: No such file or directory\n"},
        {{"--toc", "150 x 3", "--server", address}, 2, "x is not a number of frames"},
        {{"--toc", "300 150", "--server", address}, 2, "must ascend"},
        {{"--toc", kExact}, 2, "--server"},
        {{"--toc", kExact, "--server", "a:b"}, 2, "HOST"},
        {{"--server", address}, 2, "--toc"},
    };
    for (const auto& each : cases) {
        std::vector<std::string> arguments = each.arguments;
        arguments.insert(arguments.begin(), "cddb");
        const SProcessResult result = call(arguments);
        EXPECT_EQ(result.exitCode, each.code) << each.reason;
        EXPECT_NE(result.err.find(each.reason), std::string::npos) << each.reason << result.err;
    }
}

TEST_F(Network, CopiesFiles) {
    std::filesystem::create_directory(folder / "served");
    std::string bytes(64 << 20, '\0');
    std::mt19937_64 random(1);
    for (size_t i = 0; i < bytes.size(); i += 8) {
        const uint64_t word = random();
        std::memcpy(bytes.data() + i, &word, 8);
    }
    folder.write("served/large file.bin", bytes);
    folder.write("existing", "old");
    const CWebServer server(folder / "served");
    const SProcessResult result = call({"get", server.getBase() + "large%20file.bin"});
    EXPECT_EQ(result.exitCode, 0) << result.err;
    EXPECT_TRUE(readFile(folder / "large file.bin") == bytes);
    EXPECT_NE(result.out.find("large file.bin, 67.1 MB, "), std::string::npos) << result.out;
    EXPECT_NE(call({"get", server.getBase() + "none", "-o", "existing"}).err.find("--force"),
              std::string::npos);
    const SProcessResult missing = call({"get", server.getBase() + "none", "-f", "-o", "existing"});
    EXPECT_EQ(missing.err, "tonewright: " + server.getBase() + "none: HTTP error 404 (File not found)\n");
    EXPECT_EQ(call({"get", "https://host/x"}).exitCode, 1);
    EXPECT_EQ(call({"get", server.getBase()}).exitCode, 1);
    EXPECT_EQ(readFile(folder / "existing"), "old");
    EXPECT_EQ(list(), (std::set<std::string>{"cache/", "existing", "large file.bin", "served/",
                                             "served/large file.bin", "tmp/"}));

    // Ctrl-C while the server is silent.
    CProcess silent(
        {"python3", "-u", "-c",
         "import socket\ns = socket.create_server(('127.0.0.1', 0))\nprint(s.getsockname()[1])\n"
         "c, _ = s.accept()\nc.sendall(b'HTTP/1.1 200 OK\\r\\n\\r\\nbegin')\nprint('sent')\nc.recv(9999)\n"
         "c.recv(1)"});
    const auto waitFor = [&](size_t lines) {
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(30);
        while (static_cast<size_t>(std::ranges::count(silent.readOut(), '\n')) < lines &&
               std::chrono::steady_clock::now() < end)
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
    };
    waitFor(1);
    CProcess getting({kProgram, "get",
                      "http://127.0.0.1:" + std::to_string(std::atoi(silent.readOut().c_str())), "-f", "-o",
                      "existing"},
                     folder.path(), environment());
    waitFor(2);
    getting.signal(SIGINT);
    EXPECT_EQ(getting.wait().exitCode, 130);
    EXPECT_EQ(readFile(folder / "existing"), "old");
    EXPECT_EQ(list().size(), 6u);
}

TEST_F(Network, SoundOnServersIsAnInput) {
    std::filesystem::create_directory(folder / "served");
    const SSound sound = makeNoise(44100, 2, 16, 30011);
    write("served/in.wav", sound);
    peer({"flac", "-s", "served/in.wav", "-o", "served/in.flac"});
    peer({"cp", "served/in.flac", "served/query"});
    folder.write("served/text.wav", "no sound");
    const CWebServer server(folder / "served");
    const auto json = nlohmann::json::parse(call({"info", "--json", server.getBase() + "in.flac"}).out);
    EXPECT_EQ(json["codec"], "FLAC");
    EXPECT_EQ(json["file"], server.getBase() + "in.flac");
    EXPECT_EQ(json["bytes"], std::filesystem::file_size(folder / "served/in.flac"));
    for (const char* name : {"in.wav", "in.flac", "query?x=y.mp3"}) {
        const SProcessResult result = call({"convert", "-f", server.getBase() + name, "-o", "out.wav"});
        EXPECT_EQ(result.exitCode, 0) << result.err;
        EXPECT_TRUE(readWav("out.wav") == sound) << name;
    }
    EXPECT_EQ(call({"convert", server.getBase() + "in.flac", "--to", "wav"}).exitCode, 0);
    EXPECT_TRUE(readWav("in.wav") == sound);
    for (const char* bad : {"none.wav", "text.wav", ""}) {
        const SProcessResult result = call({"convert", server.getBase() + bad, "-o", "bad.wav"});
        EXPECT_EQ(result.exitCode, 1) << bad;
        EXPECT_EQ(result.err.find("tonewright: " + server.getBase() + bad + ": "), 0u) << result.err;
        EXPECT_FALSE(std::filesystem::exists(folder / "bad.wav"));
    }
}
