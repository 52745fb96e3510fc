#include "host/Program.h"

using namespace tests;

namespace {

namespace fs = std::filesystem;

class ConvertMany : public CProgramTest {
protected:
    void SetUp() override {
        for (const char* name : {"in/sub/deep", "in/.git", "in/empty"}) fs::create_directories(folder / name);
        for (const char* name : {"a", "sub/a", "sub/deep/C", ".hidden", ".git/d"})
            write(std::string("in/") + name + ".wav", makeTone(8000, 1, 16, 0.1));
        fs::rename(folder / "in/sub/deep/C.wav", folder / "in/sub/deep/C.WAV");
        folder.write("in/notes.txt", "not a sound");
        fs::create_directory_symlink("..", folder / "in/sub/loop");
        fs::create_directory_symlink("deep", folder / "in/sub/same");
    }
    std::set<std::string> listBelow(const std::string& start) {
        std::set<std::string> names;
        for (const std::string& name : list())
            if (name.starts_with(start) && !name.ends_with('/')) names.insert(name);
        return names;
    }
};

} // namespace

TEST_F(ConvertMany, KeepsTheStructureOfFolders) {
    EXPECT_TRUE(has(fail({"convert", "in", "--to", "flac"}), "--recursive"));
    EXPECT_TRUE(has(fail({"convert", "-r", "in/empty", "--to", "flac"}), "no files"));
    const auto before = list();
    const std::vector<std::string> command{"convert", "-r", "in", "-o", "out/", "--to", "flac"};
    const std::vector<std::string> dry = with(command, {"--dry-run", "--json"});
    std::set<std::string> planned;
    for (const nlohmann::json& event : parseLines(succeed(dry)))
        if (event["event"] == "planned" && event["replaces"] == false) planned.insert(event["output"]);
    EXPECT_EQ(list(), before);
    succeed(command);
    EXPECT_EQ(listBelow("out/"),
              (std::set<std::string>{"out/a.flac", "out/sub/a.flac", "out/sub/deep/C.flac"}));
    EXPECT_EQ(listBelow("out/"), planned);
    for (const nlohmann::json& event : parseLines(succeed(with(dry, {"-f"}))))
        EXPECT_EQ(event.value("replaces", false), event["event"] == "planned") << event;
    // Outputs among the inputs are not converted again.
    for (const char* extension : {"aiff", "flac"})
        succeed({"convert", "-r", "in", "-o", "in/out/", "--to", extension});
    EXPECT_EQ(listBelow("in/out/").size(), 6u);
}

TEST_F(ConvertMany, NeverWritesOntoAnInputOrTwice) {
    succeed({"convert", "in/a.wav", "-o", "in/a.flac"});
    fs::create_directory_symlink("in", folder / "link");
    fs::create_hard_link(folder / "in/a.wav", folder / "in/other.wav");
    static const struct {
        std::vector<std::string> inputs, options;
        std::set<std::string> messages;
    } kCases[] = {
        {{"in/a.wav"}, {"--to", "wav"}, {"same file"}},
        {{"in/a.flac", "in/a.wav"}, {"--to", "wav"}, {"another input", "same file"}},
        {{"in/a.flac", "in/a.wav"}, {"--to", "wav", "-o", "link"}, {"another input", "same file"}},
        {{"in/a.flac", "in/other.wav"}, {"--to", "wav"}, {"another input", "same file"}},
        {{"in/a.wav", "in/sub/a.wav"}, {"--to", "au", "-o", "in"}, {"already converted to in/a.au"}},
        {{"in/a.wav", "in/sub/a.wav"}, {"--to", "au", "--name", "%album%"}, {}},
        {{"in/a.wav", "in/sub/a.wav"},
         {"--to", "au", "--name", "%album%", "-o", "in"},
         {"already converted to in/Unknown Album.au"}},
    };
    const std::string precious = readFile(folder / "in/a.wav"), flac = readFile(folder / "in/a.flac");
    for (const auto& each : kCases)
        for (const bool dry : {true, false}) {
            std::vector<std::string> command = with(with({"convert", "-f"}, each.inputs), each.options);
            if (dry) command.push_back("-n");
            SCOPED_TRACE(testing::PrintToString(command));
            const SProcessResult result = tonewright(command);
            EXPECT_EQ(result.exitCode, each.messages.empty() ? 0 : 1);
            EXPECT_EQ(static_cast<size_t>(std::count(result.err.begin(), result.err.end(), '\n')),
                      each.messages.size())
                << result.err;
            for (const std::string& message : each.messages) EXPECT_TRUE(has(result.err, message));
            EXPECT_EQ(readFile(folder / "in/a.wav"), precious);
            EXPECT_EQ(readFile(folder / "in/a.flac"), flac);
        }
}

TEST_F(ConvertMany, LeavesOrReplacesWhatExists) {
    fs::create_directory(folder / "out");
    folder.write("out/a.flac", "precious");
    const std::vector<std::string> command{"convert", "-r", "in", "-o", "out", "--to", "flac", "-j", "1"};
    EXPECT_TRUE(has(fail(with(command, {"-n"})), "out/a.flac exists (--force"));
    EXPECT_TRUE(has(succeed(with(command, {"-n", "-f"})), "in/a.wav -> out/a.flac (replaced)\n"));
    EXPECT_TRUE(has(succeed(with(command, {"-n", "--skip"})), "out/a.flac: skipped"));
    EXPECT_EQ(listBelow("out/").size(), 1u);
    const std::string told = succeed(with(command, {"--skip"}));
    EXPECT_EQ(told.find("out/a.flac: skipped, it exists\n"), 0u) << told;
    EXPECT_EQ(listBelow("out/").size(), 3u);
    EXPECT_EQ(readFile(folder / "out/a.flac"), "precious");
    // Files that have the format already count as converted.
    const std::string again = succeed({"convert", "-r", "out", "--to", "flac", "--skip"});
    EXPECT_EQ(std::count(again.begin(), again.end(), '\n'), 3) << again;
    succeed(with(command, {"--force"}));
    peer({"flac", "-t", "-s", "out/a.flac"});
}

TEST_F(ConvertMany, NamesOutputsByTheirTags) {
    write("1.wav", makeTone(8000, 1, 16, 0.1));
    static const struct {
        std::vector<std::string> tags;
        const char* output;
    } kCases[] = {
        {{"ARTIST=AC/DC", "ALBUM=..", "TITLE=A %title%.b", "TRACKNUMBER=3"},
         "out/AC-DC/Unknown Album/03 A %title%.b.ogg"},
        {{"ARTIST=\x1b[2J\nB ", "ALBUM=C", "TRACKNUMBER=12/13"}, "out/[2J B/C/12 1.ogg"},
    };
    for (const auto& each : kCases) {
        succeed({"convert", "1.wav", "-f", "-o", "1.flac"});
        for (const std::string& tag : each.tags) {
            folder.write("value", tag.substr(tag.find('=') + 1));
            peer({"metaflac", "--set-tag-from-file=" + tag.substr(0, tag.find('=')) + "=value", "1.flac"});
        }
        succeed({"convert", "1.flac", "--to", ".ogg", "-o", "out/", "--name",
                 "%artist%/%album%/%track% %title%"});
        EXPECT_EQ(listBelow("out/"), std::set<std::string>{each.output});
        fs::remove_all(folder / "out");
    }
}

TEST_F(ConvertMany, KeepsTimesOnRequest) {
    const auto time = fs::file_time_type::clock::now() - std::chrono::hours(1000);
    fs::last_write_time(folder / "in/a.wav", time);
    for (const char* output : {"a.flac", "a.mp3", "a.wav"}) {
        succeed({"convert", "in/a.wav", "-o", output});
        EXPECT_GT(fs::last_write_time(folder / output), time + std::chrono::hours(999));
        succeed({"convert", "in/a.wav", "--times", "-f", "-o", output});
        EXPECT_EQ(fs::last_write_time(folder / output), time) << output;
    }
}
