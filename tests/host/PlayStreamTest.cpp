// Playing what web servers send without an end in sight.
#include "host/Sound.h"

#include <algorithm>

using namespace tests;

namespace {

// Sends the file "sound" without its length: whole, cut off, or with its last second over and over.
constexpr const char* kServer = R"(import http.server as h
sound = open('sound', 'rb').read()
class Handler(h.BaseHTTPRequestHandler):
    protocol_version = 'HTTP/1.1'
    def send_chunk(self, data): self.wfile.write(b'%x\r\n%s\r\n' % (len(data), data))
    def do_GET(self):
        if self.path == '/none': return self.send_error(404)
        self.close_connection = True
        self.send_response(200); self.send_header('Transfer-Encoding', 'chunked'); self.end_headers()
        try:
            if self.path == '/silent': self.send_chunk(b'RIFF'); print('silent'); return self.rfile.read()
            self.send_chunk(sound)
            while self.path == '/endless': self.send_chunk(sound[-44100 * 4:])
            if self.path == '/whole': self.send_chunk(b'')
        except OSError: pass
    def log_message(self, *arguments): pass
server = h.ThreadingHTTPServer(('127.0.0.1', 0), Handler)
print(server.server_port)
server.serve_forever()
)";

class PlayStream : public CSoundTest {
protected:
    PlayStream() : CSoundTest(EMicrophone::none) {
        std::filesystem::create_directory(folder / "tmp");
        std::string wav = toWav(makeLoudNoise(1.5));
        wav.replace(4, 4, "\xFF\xFF\xFF\xFF"); // sizes that are not known
        wav.replace(wav.find("data") + 4, 4, "\xFF\xFF\xFF\xFF");
        folder.write("sound", wav);
        m_server.emplace(std::vector<std::string>{"python3", "-u", "-c", kServer}, folder.path());
        EXPECT_TRUE(waitForLines(*m_server, 1));
        base = "http://127.0.0.1:" + std::to_string(std::atoi(m_server->readOut().c_str()));
    }
    // Nothing was copied, and the pipes are gone.
    void TearDown() override {
        for (const std::string& name : list()) EXPECT_FALSE(has(name, "stream."));
    }

    CEnvironment temporary{"TMPDIR", folder / "tmp"};
    CEnvironment direct{"http_proxy", ""};
    std::string base;
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
    EXPECT_TRUE(waitForLines(*m_server, 3)); // its port, the question for the length, and the stream
    terminal->getProcess().signal(SIGINT);
    EXPECT_EQ(terminal->getProcess().wait().exitCode, 130);
}
