#include "host/Sound.h"

using namespace tests;

namespace {

// The program must not wait for a failing thread, which would take ten seconds.
constexpr double kQuick = 8;

class Play : public CSoundTest {
protected:
    Play() : CSoundTest(EMicrophone::none) {}

    // Plays noise and returns the sound that was heard, without the silence before and after.
    std::string hear(const SSound& noise, SProcessResult& result) {
        write("noise.wav", noise);
        const std::unique_ptr<CProcess> ears = server.listen();
        result = tonewright({"play", "noise.wav", "-q"});
        EXPECT_EQ(result.exitCode, 0);
        EXPECT_EQ(result.out + result.err, "");
        return trim(ears->readOut());
    }
};

} // namespace

// While other tests run, the sound server may have to wait for a processor and then plays a gap of its own.
// That is a failure only if it happens every time.
TEST_F(Play, IsBitExactAndHardlyCostsAnything) {
    const SSound noise = makeLoudNoise(30);
    SProcessResult result;
    std::string heard = hear(noise, result);
    for (int again = 0; again < 2 && heard != noise.samples; ++again) {
        EXPECT_TRUE(withoutGaps(heard) == noise.samples);
        heard = hear(noise, result);
    }
    EXPECT_TRUE(heard == noise.samples);
    const double cost = result.cpuSeconds / 30;
    RecordProperty("cost", std::to_string(cost));
#ifndef TONEWRIGHT_SANITIZED
    EXPECT_LT(cost, 0.05); // of a core; about a third of that on an idle machine
#endif
}

// Gaps are reported but allowed here; no sound is lost, repeated or out of order.
TEST_F(Play, LosesNothingOnABusyMachine) {
    std::vector<std::unique_ptr<CProcess>> others;
    for (int i = 0; i < 4; ++i)
        others.push_back(std::make_unique<CProcess>(
            std::vector<std::string>{"setpriv", "--pdeathsig", "KILL", "sh", "-c", "while :; do :; done"}));
    const SSound noise = makeLoudNoise(30);
    SProcessResult result;
    const std::string heard = hear(noise, result);
    const std::string sound = withoutGaps(heard);
    RecordProperty("gaps", std::to_string(static_cast<double>(heard.size() - sound.size()) / 4 / 44100));
    EXPECT_TRUE(sound == noise.samples);
}

TEST_F(Play, PausesWithoutLosingAnything) {
    const SSound noise = makeLoudNoise(4);
    write("noise.wav", noise);
    const std::unique_ptr<CProcess> ears = server.listen();
    const auto terminal = start({"play", "noise.wav"});
    CProcess& program = terminal->getProcess();
    const auto isPaused = [](const auto& event) { return event.value("state", "") == "paused"; };
    waitForPosition(program, 1);
    terminal->type(' ');
    const double paused = waitFor(program, isPaused)["position"];
    EXPECT_LT(paused, 4);
    std::this_thread::sleep_for(std::chrono::seconds(1)); // the pause lasts this long
    terminal->type(' ');
    const SProcessResult result = program.wait();
    EXPECT_EQ(result.exitCode, 0) << result.out << terminal->getScreen();

    std::string heard = trim(ears->readOut());
    const size_t gap = heard.find(std::string(4096, '\0'));
    ASSERT_NE(gap, std::string::npos);
    const size_t start = gap / 4 * 4 + (heard.substr(gap / 4 * 4, 4) == std::string(4, '\0') ? 0 : 4);
    const size_t silent = heard.find_first_not_of('\0', start) / 4 * 4 - start;
    EXPECT_GE(silent, 44100u * 4 * 9 / 10);
    EXPECT_TRUE(withoutGaps(heard) == noise.samples);
    EXPECT_TRUE(terminal->isInUsualMode());
}

TEST_F(Play, TellsWhereItIs) {
    write("a.wav", makeTone(44100, 2, 16, 1.5));
    const std::vector<nlohmann::json> events = parseLines(succeed({"play", "a.wav", "--json"}));
    EXPECT_EQ(events.front()["event"], "start");
    EXPECT_EQ(events.back()["event"], "done");
    EXPECT_DOUBLE_EQ(events.back()["duration"], 1.5);
    double last = 0;
    size_t count = 0;
    for (const nlohmann::json& event : events) {
        EXPECT_EQ(event["input"], "a.wav");
        if (event["event"] != "progress") continue;
        ++count;
        EXPECT_GE(event["position"], last);
        EXPECT_LE(event["position"], 1.5);
        last = event["position"];
    }
    EXPECT_GE(count, 3u); // twice a second
    EXPECT_EQ(succeed({"play", "a.wav"}), "a.wav: 0:01.5 played\n");
}

TEST_F(Play, IsOneLineOnATerminal) {
    write("a.wav", makeTone(44100, 2, 16, 0.5));
    CTerminal terminal({kProgram, "play", "a.wav"}, CTerminal::EOutput::terminal, folder.path(),
                       programEnvironment());
    const SProcessResult result = terminal.getProcess().wait();
    EXPECT_EQ(result.exitCode, 0);
    const std::string screen = terminal.getScreen();
    EXPECT_NE(screen.find("/ 0:00.5"), std::string::npos) << screen;
    EXPECT_EQ(screen.find('\n'), screen.size() - 1) << screen;
    EXPECT_TRUE(screen.ends_with("\r\x1b[Ka.wav: 0:00.5 played\r\n")) << screen;
}

TEST_F(Play, StopsWhenItIsTold) {
    write("a.wav", makeTone(44100, 2, 16, 60));
    for (const auto& [key, exitCode] : {std::pair('q', 0), std::pair('\x03', 130)}) {
        SCOPED_TRACE(static_cast<int>(key));
        const auto terminal = start({"play", "a.wav", "a.wav"});
        CProcess& program = terminal->getProcess();
        waitForPosition(program, 0.2);
        EXPECT_FALSE(terminal->isInUsualMode());
        const auto told = Clock::now();
        terminal->type(key);
        const SProcessResult result = program.wait();
        EXPECT_LT(since(told), kQuick);
        EXPECT_EQ(result.exitCode, exitCode) << result.out << terminal->getScreen();
        EXPECT_EQ(parseLines(result.out).back()["event"], "cancelled");
        EXPECT_TRUE(terminal->isInUsualMode());
    }
}

// SIGKILL cannot be caught, but whatever else ends the program restores the terminal.
TEST_F(Play, RestoresTheTerminalInEveryCase) {
    write("a.wav", makeTone(44100, 2, 16, 60));
    for (int signal : {SIGTERM, SIGQUIT, SIGHUP, SIGABRT}) {
        SCOPED_TRACE(signal);
        const auto terminal = start({"play", "a.wav"});
        CProcess& program = terminal->getProcess();
        waitForPosition(program, 0.1);
        EXPECT_FALSE(terminal->isInUsualMode());
        program.signal(signal);
        const auto end = Clock::now() + std::chrono::seconds(30);
        while (!terminal->isInUsualMode() && Clock::now() < end)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        EXPECT_TRUE(terminal->isInUsualMode());
    }
}

TEST_F(Play, GoesOnWithTheNextFile) {
    const SSound noise = makeLoudNoise(0.5);
    write("good.wav", noise);
    folder.write("bad.wav", "RIFF");
    folder.write("notes.txt", "no sound");
    const std::unique_ptr<CProcess> ears = server.listen();
    const std::string err = fail({"play", "missing.wav", "bad.wav", "notes.txt", "good.wav"});
    EXPECT_NE(err.find("missing.wav: No such file"), std::string::npos) << err;
    EXPECT_NE(err.find("tonewright: bad.wav: Could not read: "), std::string::npos) << err;
    EXPECT_NE(err.find("tonewright: notes.txt: No plug-in reads .txt files"), std::string::npos) << err;
    EXPECT_TRUE(trim(ears->readOut()) == noise.samples);
}

TEST_F(Play, EndsWithTheSoundServerInAPauseToo) {
    // The whole sound is already in the device's queue, so no write can fail.
    write("a.wav", makeTone(44100, 2, 16, 5));
    const auto terminal = start({"play", "a.wav"});
    CProcess& program = terminal->getProcess();
    waitForPosition(program, 0.2);
    terminal->type(' ');
    waitFor(program, [](const auto& event) { return event.value("state", "") == "paused"; });
    const auto killed = Clock::now();
    server.kill();
    EXPECT_EQ(program.wait().exitCode, 1);
    EXPECT_LT(since(killed), kQuick);
    EXPECT_TRUE(terminal->isInUsualMode());
}

TEST_F(Play, EndsWithTheSoundServer) {
    write("a.wav", makeTone(44100, 2, 16, 60));
    CProcess program({kProgram, "play", "a.wav", "--json"}, folder.path(), programEnvironment());
    waitForPosition(program, 0.5);
    const auto killed = Clock::now();
    server.kill();
    const SProcessResult result = program.wait();
    EXPECT_LT(since(killed), kQuick);
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.err, "");
    const nlohmann::json last = parseLines(result.out).back();
    EXPECT_EQ(last["event"], "error");
    EXPECT_NE(last["message"].get<std::string>().find("device"), std::string::npos) << last;
}
