// What is played, and in which order.
#include "host/Sound.h"

using namespace tests;

namespace {

class Playlist : public CSoundTest {
protected:
    Playlist() : CSoundTest(EMicrophone::none) {}

    // The inputs in the order in which they were played; those that failed are followed by the reason.
    std::string play(const std::vector<std::string>& arguments) {
        const SProcessResult result = tonewright(with({"play", "--json", "--volume", "0"}, arguments));
        std::string played;
        for (const nlohmann::json& event : parseLines(result.out)) {
            if (event["event"] == "start")
                played += (played.empty() ? "" : " ") + event["input"].get<std::string>();
            if (event["event"] == "start" && event.contains("track"))
                played += "#" + std::to_string(event["track"].get<int>());
            if (event["event"] == "error") played += "(" + event["message"].get<std::string>() + ")";
        }
        EXPECT_EQ(result.exitCode, played.find('(') == std::string::npos ? 0 : 1) << result.err;
        return played;
    }
};

} // namespace

TEST_F(Playlist, InputsAreListedInOrder) {
    const std::string folders = "disc/sub/deep";
    std::filesystem::create_directories(folder / folders);
    for (const char* name :
         {"10.wav", "9.wav", "disc/B2.wav", "disc/b10.WAV", "disc/a.wav", "disc/.hidden.wav",
          "disc/sub/1.wav", "disc/sub/deep/2.wav", "a \xe4.wav", "\xc3\xa4.wav"})
        write(name, makeTone(44100, 2, 16, 0.05));
    folder.write("disc/notes.txt", "no sound");
    std::filesystem::create_directory_symlink("..", folder / "disc/sub/loop");
    std::filesystem::create_directory(folder / "empty");

    const std::string uri = "file://" + folder.path().string() + "/10.wav";
    folder.write("utf8.m3u8",
                 "\xEF\xBB\xBF#EXTM3U\r\n#EXTINF:1,Title\r\n\xc3\xa4.wav\r\n\r\ndisc\\a.wav\r\n");
    folder.write("latin.m3u", "a \xe4.wav\n\xe4.wav\n" + uri + "\n"); // the bytes of one name, and Latin-1
    folder.write("disc/up.pls",
                 "[playlist]\nNumberOfEntries=2\nFile2=../9.wav\nfile1=../10.wav\nTitle1=Ten\n");
    folder.write("self.m3u", "9.wav\nself.m3u\ndisc/up.pls\n");
    folder.write("web.m3u", "https://example.org/a.mp3\nmissing.wav\n");
    folder.write("odd.cue",
                 "FILE 9.wav WAVE\nTRACK 1 AUDIO\nINDEX 01 0:0:2\nTRACK 2 AUDIO\nINDEX 01 0:0:1\n"
                 "TRACK 3 AUDIO\nTRACK 4 AUDIO\nINDEX 01 9:0:0\nFILE disc/a.wav WAVE\nTRACK 5 AUDIO\n"
                 "INDEX 01 0:0:1\nTRACK 6 MODE1/2352\nINDEX 01 0:0:2\n");
    folder.write("bad.cue", "FILE 9.wav WAVE\nTRACK 1 AUDIO\nINDEX 01 0:0:75\n");
    folder.write("web.cue",
                 "FILE \"https://host/a\" WAVE\nTRACK 1 AUDIO\nINDEX 01 0:0:5\n"
                 "TRACK 3 AUDIO\nINDEX 01 0:0:1\nFILE 9.wav WAVE\nTRACK 2 AUDIO\nINDEX 01 0:0:0\n");
    const struct {
        std::vector<std::string> arguments;
        std::string played;
    } kCases[] = {
        {{"disc"}, "disc/a.wav disc/B2.wav disc/b10.WAV"},
        {{"-r", "disc"},
         "disc/a.wav disc/B2.wav disc/b10.WAV disc/sub/1.wav disc/sub/deep/2.wav disc/sub/loop(Contains "
         "itself)"},
        {{"empty"}, "empty(The folder has no sound files)"},
        {{"utf8.m3u8", "10.wav"}, "\xc3\xa4.wav disc/a.wav 10.wav"},
        {{"latin.m3u"}, "a \xef\xbf\xbd.wav \xc3\xa4.wav " + folder.path().string() + "/10.wav"},
        {{"disc/up.pls"}, "disc/../10.wav disc/../9.wav"},
        {{"self.m3u"}, "9.wav self.m3u(Contains itself) disc/../10.wav disc/../9.wav"},
        {{"web.m3u"},
         "https://example.org/a.mp3(Only files and http addresses can be played) missing.wav(No such file or "
         "directory)"},
        {{"odd.cue"},
         "odd.cue#1(Track 1 ends before it begins) odd.cue#2 odd.cue#3(Track 3 has no beginning) "
         "odd.cue#4(Track 4 begins after the end of 9.wav) odd.cue#5"},
        {{"bad.cue"}, "bad.cue(The time 0:0:75 is invalid)"},
        {{"web.cue"},
         "web.cue#1(Only files and http addresses can be played) web.cue#3(Only files and http addresses can "
         "be "
         "played) web.cue#2"},
    };
    for (const auto& [arguments, played] : kCases) EXPECT_EQ(play(arguments), played);

    std::string shuffled = play({"--shuffle", "disc", "9.wav"});
    EXPECT_EQ(std::count(shuffled.begin(), shuffled.end(), ' '), 3) << shuffled;
    // A list without anything to play ends, also with --loop.
    EXPECT_NE(play({"--loop", "web.m3u"}), "");
}

TEST_F(Playlist, LoopStartsOver) {
    write("a.wav", makeTone(44100, 2, 16, 0.1));
    const auto terminal = start({"play", "a.wav", "missing.wav", "--loop"});
    CProcess& program = terminal->getProcess();
    int count = 0;
    waitFor(program, [&](const auto&) {
        const std::string out = program.readOut();
        count = 0;
        for (const nlohmann::json& event : eventsOf(out)) count += event["event"] == "done";
        return count >= 3;
    });
    terminal->type('q');
    EXPECT_EQ(program.wait().exitCode, 1) << "one file is missing";
    EXPECT_GE(count, 3);
}

TEST_F(Playlist, OptionsAreChecked) {
    write("a.wav", makeTone(44100, 2, 16, 0.1));
    for (const char* device : {"0", "default"})
        EXPECT_EQ(succeed({"play", "a.wav", "--device", device}), "a.wav: 0:00.1 played\n");
    EXPECT_EQ(tonewright({"play", "a.wav", "--device", "nobody"}).exitCode, 3);
    for (const std::vector<std::string>& options : {std::vector<std::string>{"--start", "1:60"},
                                                    {"--start", "x"},
                                                    {"--start", "-1"},
                                                    {"--volume", "131"},
                                                    {"--start", "1.5:00"}})
        EXPECT_EQ(tonewright(with({"play", "a.wav"}, options)).exitCode, 2) << options[1];
}
