#include "host/Program.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <filesystem>
#include <fstream>

using namespace tests;

namespace {

class BoxedOption : public CProgramTest {
protected:
    BoxedOption() { write("in.wav", makeTone(44100, 2, 16, 0.5)); }

    // Nothing can be boxed within a millisecond, which shows whether a plug-in is.
    bool isBoxed(std::vector<std::string> options, const std::string& environment = "") {
        options.insert(options.end(), {"convert", "-f", "in.wav", "-o", "short.flac"});
        options.insert(options.begin(), kProgram);
        const SProcessResult result = run(
            options, folder.path(), {{"TONEWRIGHT_BOXED_DEADLINE", "1"}, {"TONEWRIGHT_BOXED", environment}});
        EXPECT_TRUE(result.exitCode == 0 || result.exitCode == 1) << result.err;
        return result.exitCode == 1;
    }
};

TEST_F(BoxedOption, Output_IsTheSame) {
    succeed({"convert", "in.wav", "-o", "plain.flac"});
    succeed({"--boxed", "convert", "in.wav", "-o", "boxed.flac"});
    EXPECT_TRUE(readFile(folder / "plain.flac") == readFile(folder / "boxed.flac"));
}

TEST_F(BoxedOption, List_NamesThePlugins) {
    EXPECT_FALSE(isBoxed({}));
    EXPECT_TRUE(isBoxed({"--boxed"}));
    EXPECT_TRUE(isBoxed({"--boxed=vorbis,sonora2_flac"}));
    EXPECT_TRUE(isBoxed({"--boxed=wav"}));
    EXPECT_FALSE(isBoxed({"--boxed=vorbis"}));
    EXPECT_TRUE(isBoxed({}, "all")) << "by the environment";
    EXPECT_FALSE(isBoxed({"--boxed=none"}, "all")) << "the option precedes it";
    EXPECT_EQ(list(), (std::set<std::string>{"in.wav", "short.flac"})) << "nothing unfinished is left";
}

// A slave that dies ends the job with a reason in one line and without an output.
TEST_F(BoxedOption, DeadSlave_IsAFailureOfTheFile) {
    write("long.wav", makeTone(44100, 2, 16, 60));
    CProcess job({kProgram, "--boxed=flac", "convert", "long.wav", "-o", "out.flac"}, folder.path());
    for (int i = 0; i < 3000 && job.isRunning(); ++i) {
        for (const auto& thread :
             std::filesystem::directory_iterator("/proc/" + std::to_string(job.getId()) + "/task")) {
            std::ifstream children(thread.path() / "children");
            for (pid_t child; children >> child;)
                if (readFile("/proc/" + std::to_string(child) + "/comm") == "sonora2_slave\n")
                    ::kill(child, SIGKILL);
        }
        ::usleep(10'000);
    }
    const SProcessResult result = job.wait();
    EXPECT_EQ(1, result.exitCode);
    EXPECT_THAT(result.err, testing::StartsWith("tonewright: long.wav: "));
    EXPECT_EQ(1, std::count(result.err.begin(), result.err.end(), '\n')) << result.err;
    EXPECT_EQ(list(), (std::set<std::string>{"in.wav", "long.wav"}));
}

} // namespace
