// Playing what web servers send without an end in sight.
#include "host/Sound.h"

#include <algorithm>

using namespace tests;

namespace {

// Sends the file "sound" without its length: whole, cut off, or with its last second over and over.
constexpr const char* kServer = "import http.server as h, sys\n"
                                "sound = open('sound', 'rb').read()\n"
                                "class Handler(h.BaseHTTPRequestHandler):\n"
                                "    protocol_version = 'HTTP/1.1'\n"
                                "    def send_chunk(self, data):\n"
                                "        self.wfile.write(b'%x\\r\\n%s\\r\\n' % (len(data), data))\n"
                                "    def do_GET(self):\n"
                                "        if self.path == '/none':\n"
                                "            return self.send_error(404)\n"
                                "        self.close_connection = True\n"
                                "        self.send_response(200)\n"
                                "        self.send_header('Transfer-Encoding', 'chunked')\n"
                                "        self.end_headers()\n"
                                "        try:\n"
                                "            if self.path == '/silent':\n"
                                "                self.send_chunk(b'RIFF')\n"
                                "                print('silent')\n"
                                "                return self.rfile.read()\n"
                                "            self.send_chunk(sound)\n"
                                "            while self.path == '/endless':\n"
                                "                self.send_chunk(sound[-44100 * 4:])\n"
                                "            if self.path == '/whole':\n"
                                "                self.send_chunk(b'')\n"
                                "        except OSError:\n"
                                "            pass\n"
                                "    def log_message(self, *arguments):\n"
                                "        pass\n"
                                "server = h.ThreadingHTTPServer(('127.0.0.1', 0), Handler)\n"
                                "print(server.server_port)\n"
                                "server.serve_forever()\n";

class PlayStream : public CSoundTest {
protected:
    PlayStream() : CSoundTest(EMicrophone::none) {
        std::filesystem::create_directory(folder / "tmp");
        std::string wav = toWav(makeLoudNoise(1.5));
        wav.replace(4, 4, "\xFF\xFF\xFF\xFF"); // sizes that are not known
        wav.replace(wav.find("data") + 4, 4, "\xFF\xFF\xFF\xFF");
        folder.write("sound", wav);
        m_server.emplace(std::vector<std::string>{"python3", "-u", "-c", kServer}, folder.path());
        waitForLines(1);
        base = "http://127.0.0.1:" + std::to_string(std::atoi(m_server->readOut().c_str()));
    }
    // That many lines of the server: its port, then one for each request that it leaves waiting.
    void waitForLines(ptrdiff_t lines) {
        const auto end = Clock::now() + std::chrono::seconds(30);
        while (std::ranges::count(m_server->readOut(), '\n') < lines && Clock::now() < end)
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    // Nothing was copied, and the pipes are gone.
    void TearDown() override {
        for (const std::string& name : list()) EXPECT_EQ(name.find("stream."), std::string::npos) << name;
    }

    CEnvironment temporary{"TMPDIR", folder / "tmp"};
    CEnvironment direct{"http_proxy", ""};
    std::string base;

private:
    std::optional<CProcess> m_server;
};

} // namespace

TEST_F(PlayStream, PlaylistsMayNameThem) {
    write("end.wav", makeLoudNoise(0.5));
    folder.write("list.m3u", "#EXTINF:-1,Radio\n" + base + "/whole\n" + base + "/none\n" + base +
                                 "/cut\nhttps://host/x\nend.wav\n");
    const SProcessResult result = tonewright({"play", "list.m3u", "--json"});
    EXPECT_EQ(result.exitCode, 1);
    std::string outcome;
    for (const auto& event : parseLines(result.out)) {
        if (event["event"] == "done" || event["event"] == "error")
            outcome += event["event"].get<std::string>() + " ";
        if (event.value("title", "") == "Radio" && event.contains("seconds")) {
            EXPECT_NEAR(event["duration"], 1.5, 1e-6);
        }
    }
    EXPECT_EQ(outcome, "done error error error done ") << result.out;
}

TEST_F(PlayStream, EndlessOnesPlayUntilTheUserStops) {
    for (const char key : {'q', '\3'}) {
        const auto terminal = start({"play", base + "/endless"});
        waitForPosition(terminal->getProcess(), 0.3);
        terminal->type('\x1b'); // a stream cannot seek, which harms nothing
        terminal->type('[');
        terminal->type('D');
        waitForPosition(terminal->getProcess(), 0.6);
        terminal->type(key);
        EXPECT_EQ(terminal->getProcess().wait().exitCode, key == 'q' ? 0 : 130);
    }
}

// While the decoder waits for the first sound.
TEST_F(PlayStream, CtrlCEndsTheWaitForOne) {
    const auto terminal = start({"play", base + "/silent"});
    waitForLines(3); // the first request finds out whether there is an end
    terminal->getProcess().signal(SIGINT);
    EXPECT_EQ(terminal->getProcess().wait().exitCode, 130);
}
