// Files on web servers.
#include "host/Network.h"

#include <fstream>
#include <random>

using namespace tests;

namespace {

class WebFiles : public CNetworkTest {};

} // namespace

TEST_F(WebFiles, CopiesFiles) {
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

TEST_F(WebFiles, SoundOnServersIsAnInput) {
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
