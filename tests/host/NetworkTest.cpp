// Files on web servers.
#include "host/Network.h"

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
    const SProcessResult result = tonewright({"get", server.getBase() + "large%20file.bin"});
    EXPECT_EQ(result.exitCode, 0) << result.err;
    EXPECT_TRUE(readFile(folder / "large file.bin") == bytes);
    EXPECT_TRUE(has(result.out, "large file.bin, 67.1 MB, "));
    EXPECT_TRUE(has(tonewright({"get", server.getBase() + "none", "-o", "existing"}).err, "--force"));
    const SProcessResult missing = tonewright({"get", server.getBase() + "none", "-f", "-o", "existing"});
    EXPECT_EQ(missing.err, "tonewright: " + server.getBase() + "none: HTTP error 404 (File not found)\n");
    EXPECT_EQ(tonewright({"get", "https://host/x"}).exitCode, 1);
    EXPECT_EQ(tonewright({"get", server.getBase()}).exitCode, 1);
    EXPECT_EQ(readFile(folder / "existing"), "old");
    EXPECT_EQ(list(), (std::set<std::string>{"cache/", "existing", "large file.bin", "served/",
                                             "served/large file.bin", "tmp/"}));

    // The name of an address, and what is known while the file arrives.
    folder.write("served/\xc3\xbcM\xcf\xaa.x", "served");
    EXPECT_EQ(tonewright({"get", server.getBase() + "%c3%Bc%4d%CF%aa.x?q=%zz#/f"}).exitCode, 0);
    EXPECT_EQ(readFile(folder / "\xc3\xbcM\xcf\xaa.x"), "served");
    std::filesystem::remove(folder / "\xc3\xbcM\xcf\xaa.x");
    std::filesystem::remove(folder / "served/\xc3\xbcM\xcf\xaa.x");
    for (const char* length : {"Content-Length: 2000\r\n", ""}) {
        const CSilentServer slow("HTTP/1.1 200 OK\r\n" + std::string(length) + "\r\nbegin", 0.2);
        CProcess getting({kProgram, "get", "--json", "http://" + slow.getAddress() + "/new"}, folder.path(),
                         programEnvironment());
        EXPECT_TRUE(waitForLines(getting, 2));
        getting.signal(SIGTERM);
        const auto events = parseLines(getting.wait().out);
        EXPECT_GE(events.at(1)["received"], 5);
        EXPECT_EQ(events.at(1)["total"], *length ? 2000 : -1);
    }

    // Ctrl-C while the server is silent, to the last of the files too.
    for (const std::vector<std::string>& arguments :
         {std::vector<std::string>{"get", "-f", "-o", "existing"}, {"info"}}) {
        const CSilentServer silent("HTTP/1.1 200 OK\r\n\r\nbegin");
        CProcess getting(with({kProgram}, with(arguments, {"http://" + silent.getAddress()})), folder.path(),
                         programEnvironment());
        silent.waitForRequest();
        getting.signal(SIGINT);
        EXPECT_EQ(getting.wait().exitCode, 130) << arguments[0];
    }
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
    const auto json = nlohmann::json::parse(tonewright({"info", "--json", server.getBase() + "in.flac"}).out);
    EXPECT_EQ(json["codec"], "FLAC");
    EXPECT_EQ(json["file"], server.getBase() + "in.flac");
    EXPECT_EQ(json["bytes"], std::filesystem::file_size(folder / "served/in.flac"));
    for (const char* name : {"in.wav", "in.flac", "query?x=y.mp3"}) {
        const SProcessResult result = tonewright({"convert", "-f", server.getBase() + name, "-o", "out.wav"});
        EXPECT_EQ(result.exitCode, 0) << result.err;
        EXPECT_TRUE(readWav("out.wav") == sound) << name;
    }
    EXPECT_EQ(tonewright({"convert", server.getBase() + "in.flac", "--to", "wav"}).exitCode, 0);
    EXPECT_TRUE(readWav("in.wav") == sound);
    for (const char* bad : {"none.wav", "text.wav", ""}) {
        const SProcessResult result = tonewright({"convert", server.getBase() + bad, "-o", "bad.wav"});
        EXPECT_EQ(result.exitCode, 1) << bad;
        EXPECT_EQ(result.err.find("tonewright: " + server.getBase() + bad + ": "), 0u) << result.err;
        EXPECT_FALSE(std::filesystem::exists(folder / "bad.wav"));
    }
}
