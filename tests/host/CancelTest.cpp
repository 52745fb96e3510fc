#include "host/Program.h"

#include <sys/stat.h>

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
};

} // namespace

// To their ends these would take minutes.
TEST_F(Cancel, LeavesEverythingAsItWas) {
    for (const char* name : {"out.mp3", "out.flac", "old.cue"}) folder.write(name, "precious");
    folder.write("a.xml", "<P><Tracks><Track><SourceEndTime>21600</SourceEndTime><Uri>long.wav</Uri></Track>"
                          "</Tracks></P>");
    folder.write("hour.wav", makeWavHeader({}, 3600 * 176400));
    std::filesystem::resize_file(folder / "hour.wav", 44 + 3600 * 176400);
    const auto before = list();
    const struct {
        std::vector<std::string> command;
        int signal;
    } kCases[] = {
        {{"convert", "long.wav", "-f", "-o", "out.mp3", "--rate", "48000", "--resampler", "best"}, SIGINT},
        {{"mix", "a.xml", "-f", "-o", "out.flac"}, SIGTERM},
        {{"burn", "hour.wav", "-f", "--image", "old.cue"}, SIGHUP},
        {{"burn", "hour.wav", "--image", "new.iso"}, SIGINT},
    };
    for (const auto& [command, signal] : kCases) {
        SCOPED_TRACE(testing::PrintToString(command));
        CProcess process(with(with({kProgram}, command), {"--json"}), folder.path(), programEnvironment());
        ASSERT_TRUE(waitUntil([&] {
            return process.readOut().find("\"progress\"") != std::string::npos &&
                   list().size() > before.size();
        }));
        process.signal(signal);
        const SProcessResult result = process.wait();
        EXPECT_EQ(result.exitCode, 130) << result.out << result.err;
        EXPECT_EQ(result.err, "");
        EXPECT_EQ(parseLines(result.out).back()["event"], "cancelled");
        EXPECT_EQ(list(), before);
        for (const char* name : {"out.mp3", "out.flac", "old.cue"})
            EXPECT_EQ(readFile(folder / name), "precious");
    }
}

TEST_F(Cancel, StopsEveryThreadAndStartsNothingMore) {
    for (const char* name : {"a.wav", "b.wav"}) write(name, makeTone(8000, 1, 16, 0.1));
    std::filesystem::create_hard_link(folder / "long.wav", folder / "second.wav");
    CProcess process({kProgram, "convert", "a.wav", "long.wav", "second.wav", "b.wav", "--to", "flac",
                      "--json", "-j", "2"},
                     folder.path(), programEnvironment());
    ASSERT_TRUE(waitUntil(
        [&] { return process.readOut().find("\"done\"") != std::string::npos && countTemporary() == 2; }));
    process.signal(SIGINT);
    const SProcessResult result = process.wait();
    EXPECT_EQ(result.exitCode, 130) << result.err;
    std::set<std::string> cancelled;
    for (const nlohmann::json& event : parseLines(result.out))
        if (event["event"] == "cancelled") cancelled.insert(event["input"]);
    EXPECT_EQ(cancelled, (std::set<std::string>{"long.wav", "second.wav"}));
    EXPECT_EQ(list(), (std::set<std::string>{"a.wav", "a.flac", "long.wav", "second.wav", "b.wav"}));
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
        ASSERT_TRUE(waitUntil(isSpooling));
        process.signal(SIGTERM);
        EXPECT_TRUE(waitUntil([&] { return !process.isRunning(); }));
        process.signal(SIGKILL);
        EXPECT_EQ(process.wait().exitCode, 130);
        EXPECT_EQ(list(), before);
    }
}
