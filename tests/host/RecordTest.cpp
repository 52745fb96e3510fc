#include "host/Sound.h"

using namespace tests;

namespace {

class Record : public CSoundTest {
protected:
    Record() : CSoundTest(EMicrophone::isolated) {}

    double durationOf(const std::string& name, const std::string& kind) {
        return static_cast<double>(peer({"sox", "-t", kind, name, "-t", "raw", "-b", "16", "-"}).size()) / 4 /
               CSoundServer::kRate;
    }
};

} // namespace

TEST_F(Record, IsBitExactUntilItIsStopped) {
    const SSound noise = makeLoudNoise(1.5);
    bool isWhole = false;
    for (int take = 0; take < 4 && !isWhole; ++take) { // a busy sound server drops samples
        const auto terminal = start({"record", "-o", "out.wav", "--force"});
        CProcess& program = terminal->getProcess();
        waitForPosition(program, 0.2);
        EXPECT_EQ(list().count("out.wav.part"), 1u);
        EXPECT_EQ(list().count("out.wav"), take > 0 ? 1u : 0u);
        EXPECT_EQ(server.play(noise.samples)->wait().exitCode, 0);
        const double position =
            program.isRunning() ? eventsOf(program.readOut()).back()["position"].get<double>() : 0;
        waitForPosition(program, position + 0.5); // sound still held by the device
        terminal->type('\x03');
        const SProcessResult result = program.wait();
        EXPECT_EQ(result.exitCode, 0) << result.out << terminal->getScreen();
        EXPECT_TRUE(terminal->isInUsualMode());
        EXPECT_EQ(list(), std::set<std::string>{"out.wav"});
        const SSound recorded = readWav("out.wav");
        isWhole = trim(recorded.samples) == noise.samples;
        EXPECT_NEAR(parseLines(result.out).back()["duration"], recorded.seconds(), 0.5);
    }
    EXPECT_TRUE(isWhole);
}

TEST_F(Record, ShowsItsLevelOnATerminal) {
    CTerminal terminal({kProgram, "record", "-o", "out.flac"}, CTerminal::EOutput::terminal, folder.path(),
                       programEnvironment());
    const std::unique_ptr<CProcess> sound = server.play(makeTone(44100, 2, 16, 10).samples);
    while (terminal.getProcess().isRunning() && terminal.getScreen().find("[####") == std::string::npos)
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    terminal.type('q');
    EXPECT_EQ(terminal.getProcess().wait().exitCode, 0);
    EXPECT_TRUE(terminal.isInUsualMode());
    const std::string screen = terminal.getScreen();
    EXPECT_EQ(screen.find('\n'), screen.size() - 1) << screen;
    EXPECT_TRUE(has(screen, "out.flac: FLAC, 0:"));
    peer({"flac", "-st", "out.flac"});
}

TEST_F(Record, TakesTheWantedFormat) {
    const struct {
        std::string name;
        std::vector<std::string> options;
        std::string format; // as reported by ffprobe
    } kCases[] = {
        {"a.wav", {"--rate", "48000", "--channels", "1"}, "pcm_s16le,48000,1"},
        {"b.wav", {"--bits", "24"}, "pcm_s24le,44100,2"},
        {"c.flac", {"--bits", "8"}, "flac,44100,2"},
        {"d.ogg", {"--quality", "0.3", "--rate", "22050"}, "vorbis,22050,2"},
        {"e.mp3", {"--bitrate", "96k", "--channels", "1"}, "mp3,44100,1"},
    };
    for (const auto& [name, options, format] : kCases) {
        SCOPED_TRACE(name);
        EXPECT_EQ(succeed(with({"record", "-o", name, "--seconds", "0.3", "-q"}, options)), "");
        EXPECT_EQ(probe(name), format);
        const double duration = std::stod(
            peer({"ffprobe", "-v", "error", "-show_entries", "format=duration", "-of", "csv=p=0", name}));
        EXPECT_GT(duration, 0.27);
        EXPECT_LT(duration, 3);
    }
}

TEST_F(Record, LeavesAFileThatPlaysWhenItIsKilled) {
    for (const std::string kind : {"wav", "flac"}) {
        SCOPED_TRACE(kind);
        const std::string name = "out." + kind;
        const auto terminal = start({"record", "-o", name});
        CProcess& program = terminal->getProcess();
        const double position = waitForPosition(program, 1.3)["position"];
        program.signal(SIGKILL);
        program.wait();
        EXPECT_EQ(list().count(name + ".part"), 1u);
        EXPECT_GT(durationOf(name + ".part", kind), position - 1);
        // The next recording to the same name is refused and leaves the file alone.
        const std::string bytes = readFile(folder / (name + ".part"));
        const SProcessResult refused = tonewright({"record", "-o", name, "--seconds", "0.2"});
        EXPECT_EQ(refused.exitCode, 1);
        EXPECT_TRUE(has(refused.err, name + ".part was left"));
        EXPECT_TRUE(readFile(folder / (name + ".part")) == bytes);
        succeed({"record", "-o", name, "--seconds", "0.2", "--force", "-q"});
        EXPECT_EQ(list().count(name + ".part"), 0u);
    }
}

TEST_F(Record, KeepsWhatItHasWhenTheSoundServerEnds) {
    const auto terminal = start({"record", "-o", "out.wav"});
    CProcess& program = terminal->getProcess();
    const double position = waitForPosition(program, 1)["position"];
    const auto killed = Clock::now();
    server.kill();
    const SProcessResult result = program.wait();
    EXPECT_LT(since(killed), 8);
    EXPECT_EQ(result.exitCode, 1);
    const nlohmann::json last = parseLines(result.out).back();
    EXPECT_EQ(last["event"], "error");
    EXPECT_TRUE(has(last["message"].get<std::string>(), "device stopped")) << last;
    EXPECT_EQ(list(), std::set<std::string>{"out.wav"});
    EXPECT_GT(readWav("out.wav").seconds(), position - 0.5);
}

TEST_F(Record, RefusesWhatItCannotWrite) {
    folder.write("old.wav", "precious");
    folder.write("file", "");
    const struct {
        std::vector<std::string> command;
        const char* reason;
    } kCases[] = {
        {{"record", "-o", "old.wav"}, "old.wav: Exists (--force replaces it)"},
        {{"record", "-o", "none/out.wav"}, "The folder none does not exist"},
        {{"record", "-o", "out.xyz"}, "out.xyz: No plug-in writes .xyz files"},
        {{"record", "-o", "out.mp3", "--rate", "96000"}, "out.mp3: "},
        {{"record", "-o", "out.wav", "--channels", "7"}, "out.wav: "},
        {{"record", "-o", "/proc/out.wav"}, "Could not create: No such file or directory\n"},
    };
    for (const auto& [command, reason] : kCases) {
        const SProcessResult result = tonewright(command);
        EXPECT_EQ(result.exitCode, 1) << result.err;
        EXPECT_TRUE(has(result.err, reason));
    }
    EXPECT_EQ(readFile(folder / "old.wav"), "precious");
    EXPECT_EQ(list(), (std::set<std::string>{"file", "old.wav"}));
}
