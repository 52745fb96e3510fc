#include "host/Program.h"

#include <sys/stat.h>

#include <chrono>
#include <thread>

using namespace tests;

namespace {

class Cancel : public CProgramTest {
protected:
    void SetUp() override {
        // Six hours in a sparse file.
        const SSound silence{44100, 2, 16, {}};
        const uint32_t bytes = 6 * 3600 * 44100u * 4;
        folder.write("long.wav", makeWavHeader(silence, bytes));
        std::filesystem::resize_file(folder / "long.wav", 44 + uint64_t{bytes});
    }
    size_t countTemporary() {
        size_t count = 0;
        for (const std::string& name : list()) count += name.find(".part") != std::string::npos;
        return count;
    }
    template <class Condition> bool waitFor(Condition condition) {
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(60);
        while (!condition()) {
            if (std::chrono::steady_clock::now() > end) return false;
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        return true;
    }
};

} // namespace

// To its end the conversion would take minutes.
TEST_F(Cancel, LeavesEverythingAsItWas) {
    folder.write("out.mp3", "precious");
    for (int signal : {SIGINT, SIGTERM, SIGHUP}) {
        SCOPED_TRACE(signal);
        CProcess process({kProgram, "convert", "long.wav", "-f", "-o", "out.mp3", "--rate", "48000",
                          "--resampler", "best"},
                         folder.path(), programEnvironment());
        ASSERT_TRUE(waitFor([&] { return countTemporary() == 1; }));
        const auto start = std::chrono::steady_clock::now();
        process.signal(signal);
        const SProcessResult result = process.wait();
        EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(30));
        EXPECT_EQ(result.exitCode, 130) << result.err;
        EXPECT_EQ(result.err, "");
        EXPECT_EQ(list(), (std::set<std::string>{"long.wav", "out.mp3"}));
        EXPECT_EQ(readFile(folder / "out.mp3"), "precious");
    }
}

TEST_F(Cancel, IsAnEventAndStartsNothingMore) {
    for (const char* name : {"a.wav", "b.wav"}) write(name, makeTone(8000, 1, 16, 0.1));
    CProcess process({kProgram, "convert", "a.wav", "long.wav", "b.wav", "--to", "flac", "--json", "-j", "1"},
                     folder.path(), programEnvironment());
    ASSERT_TRUE(waitFor([&] {
        return process.readOut().find("\"progress\"") != std::string::npos && countTemporary() == 1;
    }));
    process.signal(SIGINT);
    const SProcessResult result = process.wait();
    EXPECT_EQ(result.exitCode, 130) << result.err;
    const std::vector<nlohmann::json> events = parseLines(result.out);
    ASSERT_FALSE(events.empty());
    EXPECT_EQ(events.back()["event"], "cancelled");
    EXPECT_EQ(events.back()["input"], "long.wav");
    EXPECT_EQ(list(), (std::set<std::string>{"a.wav", "a.flac", "long.wav", "b.wav"}));
}

TEST_F(Cancel, StopsEveryThread) {
    std::vector<std::string> command{kProgram, "convert", "--to", "flac", "--json", "-j", "3"};
    for (const char* name : {"1.wav", "2.wav", "3.wav"}) {
        std::filesystem::create_hard_link(folder / "long.wav", folder / name);
        command.push_back(name);
    }
    CProcess process(command, folder.path(), programEnvironment());
    ASSERT_TRUE(waitFor([&] { return countTemporary() == 3; }));
    process.signal(SIGINT);
    const SProcessResult result = process.wait();
    EXPECT_EQ(result.exitCode, 130) << result.err;
    size_t cancelled = 0;
    for (const nlohmann::json& event : parseLines(result.out)) cancelled += event["event"] == "cancelled";
    EXPECT_EQ(cancelled, 3u);
    EXPECT_EQ(list(), (std::set<std::string>{"1.wav", "2.wav", "3.wav", "long.wav"}));
}

TEST_F(Cancel, DoesNotComeFromAReaderThatLeft) {
    write("in.wav", makeTone(44100, 2, 16, 1));
    // The reader ends at once, so that the program writes to a closed pipe.
    const SProcessResult result = run({"bash", "-c",
                                       "\"$0\" convert in.wav -o out.flac --json | true; "
                                       "echo ${PIPESTATUS[0]}",
                                       kProgram},
                                      folder.path(), programEnvironment());
    EXPECT_EQ(result.out, "0\n") << result.err;
    peer({"flac", "-t", "-s", "out.flac"});
}

// A stream that does not end is left, and so is one that nobody reads.
TEST_F(Cancel, EndsWaitingForOtherPrograms) {
    write("in.wav", makeNoise(44100, 2, 16, 500000));
    ASSERT_EQ(::mkfifo((folder / "pipe").c_str(), 0600), 0);
    auto environment = programEnvironment();
    environment.emplace_back("TMPDIR", folder.path().string());
    const auto before = list();
    const auto isSpooling = [&] {
        for (const std::string& name : list())
            if (name.starts_with("tonewright-") && !name.ends_with('/') &&
                name.find(".part") == std::string::npos)
                return true;
        return false;
    };
    for (const char* arguments : {"- -o out.wav <&3", "in.wav -o - --to wav >&3"}) {
        SCOPED_TRACE(arguments);
        CProcess process(
            {"bash", "-c", std::string("exec 3<>pipe; exec \"$0\" convert ") + arguments, kProgram},
            folder.path(), environment);
        ASSERT_TRUE(waitFor(isSpooling));
        process.signal(SIGTERM);
        EXPECT_TRUE(waitFor([&] { return !process.isRunning(); }));
        process.signal(SIGKILL);
        EXPECT_EQ(process.wait().exitCode, 130);
        EXPECT_EQ(list(), before);
    }
}
