#include "host/Sound.h"

#include <functional>

using namespace tests;

namespace {

// The program must not wait for a failing thread, which would take ten seconds.
constexpr double kQuick = 8;
// The most takes of a test that a busy sound server may spoil.
constexpr int kTakes = 4;

class Play : public CSoundTest {
protected:
    Play() : CSoundTest(EMicrophone::none) {}

    // Plays the files and returns the sound that was heard, without the silence before and after.
    std::string hear(std::vector<std::string> arguments, int exitCode = 0) {
        arguments.insert(arguments.begin(), {"play", "-q"});
        const std::unique_ptr<CProcess> ears = server.listen();
        const SProcessResult result = tonewright(arguments);
        EXPECT_EQ(result.exitCode, exitCode);
        EXPECT_EQ(result.out, "");
        EXPECT_EQ(result.err.empty(), exitCode == 0) << result.err;
        return trim(ears->readOut());
    }
};

} // namespace

TEST_F(Play, IsBitExact) {
    const SSound noise = makeLoudNoise(3);
    write("noise.wav", noise);
    std::string heard;
    for (int take = 0; take < kTakes && heard != noise.samples; ++take) heard = hear({"noise.wav"});
    EXPECT_TRUE(heard == noise.samples);
}

// Two halves of a recording in each format, cut at an odd frame, and a file between them that cannot be
// played.
TEST_F(Play, JoinsFilesWithoutAGap) {
    const SSound noise = makeLoudNoise(0.7);
    SSound halves[] = {noise, noise};
    halves[0].samples.resize(10'007 * 4);
    halves[1].samples.erase(0, 10'007 * 4);
    std::string expected, missing = "RIFF";
    std::vector<std::string> files;
    for (const std::string kind : {"wav", "flac", "mp3", "ogg"}) {
        for (const std::string half : {"0", "1"}) {
            const std::string name = kind + half + "." + kind, wav = kind + half + ".wav";
            write(wav, halves[half == "1"]);
            if (kind == "flac") peer({"flac", "-s", wav, "-o", name});
            if (kind == "mp3") peer({"lame", "--quiet", "-b", "192", wav, name});
            if (kind == "ogg") peer({"oggenc", "-Q", wav, "-o", name});
            files.push_back(name);
            // The decoders are tested elsewhere; here it matters where one file ends and the next begins.
            if (kind != "wav") succeed({"convert", name, "-o", wav, "-f", "-q", "--bits", "16"});
            const SSound decoded = readWav(wav);
            EXPECT_EQ(decoded.samples.size(), halves[half == "1"].samples.size()) << name;
            expected += decoded.samples;
            folder.write(name + ".bad.wav", missing);
            files.push_back(name + ".bad.wav");
        }
    }
    std::string heard;
    for (int take = 0; take < kTakes && heard != expected; ++take) heard = hear(files, 1);
    EXPECT_EQ(heard.size(), expected.size());
    EXPECT_TRUE(heard == expected);
}

TEST_F(Play, CutsCueSheetsToTheSample) {
    const SSound noise = makeLoudNoise(1.2);
    write("Whole Album.wav", noise);
    folder.write("album.cue", "\xEF\xBB\xBFREM x\r\nTITLE \"All\"\r\nFILE \"Whole Album.wav\" WAVE\r\n"
                              "  TRACK 01 AUDIO\r\n    INDEX 01 00:00:00\r\n"
                              "  TRACK 02 AUDIO\r\n    TITLE \"Two\"\r\n    INDEX 00 00:00:20\r\n"
                              "    INDEX 01 00:00:31\r\n"
                              "  TRACK 03 AUDIO\r\n    INDEX 01 00:00:74\r\n");
    std::string heard;
    for (int take = 0; take < kTakes && heard != noise.samples; ++take) heard = hear({"album.cue"});
    EXPECT_TRUE(heard == noise.samples);
    const std::string rest = noise.samples.substr(74 * 588 * 4 + 4410 * 4);
    folder.write("last.cue", "FILE Whole Album.wav WAVE\nTRACK 3 AUDIO\nINDEX 01 0:0:74");
    for (int take = 0; take < kTakes && heard != rest; ++take)
        heard = hear({"last.cue", "--start", "0:00.1"});
    EXPECT_TRUE(heard == rest);
}

TEST_F(Play, ObeysKeys) {
    for (const char* name : {"a.wav", "b.wav"}) write(name, makeTone(44100, 2, 16, 100));
    const auto terminal = start({"play", "a.wav", "b.wav", "--volume", "50"});
    CProcess& program = terminal->getProcess();
    const auto press = [&](const std::string& keys) {
        for (const char key : keys) terminal->type(key);
    };
    // Waits for an event after those that were there before.
    size_t seen = 0;
    double before = 0; // the position of the event before
    const auto await = [&](const std::function<bool(const nlohmann::json&)>& serves) {
        while (program.isRunning()) {
            const std::vector<nlohmann::json> events = eventsOf(program.readOut());
            while (seen < events.size()) {
                const nlohmann::json& event = events[seen++];
                const bool isAwaited = serves(event);
                before = event.value("position", before);
                if (isAwaited) return;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        }
        ADD_FAILURE() << "the program has ended";
    };
    const auto plays = [](const char* name) {
        return [name](const auto& event) { return event["event"] == "start" && event["input"] == name; };
    };
    const auto isBetween = [](double from, double to) {
        return [from, to](const auto& event) {
            return event["event"] == "progress" && event["position"] >= from && event["position"] < to;
        };
    };
    const auto isLoud = [](int volume, bool isMuted) {
        return [volume, isMuted](const auto& event) {
            return event["event"] == "progress" && event["volume"] == volume &&
                   event.contains("muted") == isMuted;
        };
    };
    await(isLoud(50, false));
    press("\x1b[C\x1b[A");
    await(isBetween(65, 100));
    press("\x1b[D\x1b[3~"); // the second one has no meaning, and must not be taken for keys
    await([&](const auto& event) { return event.value("position", before) < before - 1; });
    press("\x1bOB");
    await(isBetween(0, 60));
    press("++-");
    await(isLoud(55, false));
    press("m");
    await(isLoud(55, true));
    press("n");
    await(plays("b.wav"));
    await(isBetween(0, 30));
    press("p");
    await(plays("a.wav"));
    await(isLoud(55, true));
    press("nn");
    const SProcessResult result = program.wait();
    EXPECT_EQ(result.exitCode, 0) << result.out << terminal->getScreen();
}

TEST_F(Play, GoesOnAfterDamage) {
    SSound noise = makeLoudNoise(2);
    write("damaged.wav", noise);
    peer({"flac", "-s", "-0", "damaged.wav"});
    std::string bytes = readFile(folder / "damaged.flac");
    std::fill_n(bytes.begin() + static_cast<ptrdiff_t>(bytes.size() / 2), 3000, '\0');
    folder.write("damaged.flac", bytes);
    write("last.wav", makeTone(44100, 2, 16, 0.1));
    const std::string err = fail({"play", "damaged.flac", "last.wav", "damaged.flac"});
    EXPECT_EQ(std::count(err.begin(), err.end(), '\n'), 2) << err;
    EXPECT_EQ(err.find("tonewright: damaged.flac: "), 0u) << err;
}

TEST_F(Play, PausesWithoutLosingAnything) {
    const SSound noise = makeLoudNoise(2);
    write("noise.wav", noise);
    const std::unique_ptr<CProcess> ears = server.listen();
    const auto terminal = start({"play", "noise.wav"});
    CProcess& program = terminal->getProcess();
    const auto isPaused = [](const auto& event) { return event.value("state", "") == "paused"; };
    waitForPosition(program, 0.3);
    terminal->type(' ');
    const double paused = waitFor(program, isPaused)["position"];
    EXPECT_LT(paused, 2);
    std::this_thread::sleep_for(std::chrono::milliseconds(500)); // the pause lasts this long
    terminal->type(' ');
    const SProcessResult result = program.wait();
    EXPECT_EQ(result.exitCode, 0) << result.out << terminal->getScreen();

    std::string heard = trim(ears->readOut());
    const size_t gap = heard.find(std::string(4096, '\0'));
    ASSERT_NE(gap, std::string::npos);
    const size_t start = gap / 4 * 4 + (heard.substr(gap / 4 * 4, 4) == std::string(4, '\0') ? 0 : 4);
    const size_t silent = heard.find_first_not_of('\0', start) / 4 * 4 - start;
    EXPECT_GE(silent, 44100u * 4 * 4 / 10);
    EXPECT_TRUE(withoutGaps(heard) == noise.samples);
    EXPECT_TRUE(terminal->isInUsualMode());
}

TEST_F(Play, TellsWhereItIs) {
    write("a.wav", makeTone(44100, 2, 16, 1.5));
    write("b.wav", makeTone(44100, 2, 16, 0.2));
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
    EXPECT_EQ(succeed({"play", "b.wav"}), "b.wav: 0:00.2 played\n");
}

TEST_F(Play, IsOneLineOnATerminal) {
    write("a.wav", makeTone(44100, 2, 16, 0.5));
    CTerminal terminal({kProgram, "play", "a.wav"}, CTerminal::EOutput::terminal, folder.path(),
                       programEnvironment());
    const SProcessResult result = terminal.getProcess().wait();
    EXPECT_EQ(result.exitCode, 0);
    const std::string screen = terminal.getScreen();
    EXPECT_TRUE(has(screen, "/ 0:00.5"));
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
    EXPECT_TRUE(has(last["message"].get<std::string>(), "device")) << last;
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
    EXPECT_TRUE(withoutGaps(ears->readOut()) == noise.samples);
}
