#include "host/Program.h"

#include <gmock/gmock.h>

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

} // namespace
