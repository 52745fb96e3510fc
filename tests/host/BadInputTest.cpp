#include "host/Program.h"

#include <sys/stat.h>

using namespace tests;

namespace {

class BadInput : public CProgramTest {
protected:
    void expectMessage(const std::string& message, const std::vector<std::string>& parts) {
        EXPECT_EQ(std::count(message.begin(), message.end(), '\n'), 1) << message;
        for (const std::string& part : parts) EXPECT_TRUE(has(message, part));
    }
};

class BadOutput : public BadInput {};

} // namespace

TEST_F(BadInput, IsToldByNameAndReason) {
    folder.write("empty.wav", "");
    folder.write("text.flac", "This is no sound file, only a text that somebody gave a wrong name.\n");
    folder.write("header.wav", makeWavHeader({}, 0).substr(0, 20));
    folder.write("sound.xyz", toWav(makeTone(8000, 1, 16, 0.1)));
    folder.write("no extension", "no sound");
    std::filesystem::create_directory(folder / "folder.wav");
    ASSERT_EQ(::mkfifo((folder / "pipe.wav").c_str(), 0600), 0);
    const auto before = list();
    static const struct {
        const char* input;
        const char* reason;
    } kCases[] = {
        {"missing.wav", "No such file or directory"},
        {"empty.wav", "The file is empty"},
        {"folder.wav", "Is a directory"},
        {"pipe.wav", "Is not a regular file"},
        {"empty.wav/a.wav", "Not a directory"},
        {"text.flac", ""},
        {"header.wav", ""},
        {"sound.xyz", "No plug-in reads"},
        {"no extension", "No plug-in reads files without an extension"},
    };
    for (const auto& bad : kCases) {
        SCOPED_TRACE(bad.input);
        const std::string start = std::string("tonewright: ") + bad.input + ": ";
        for (const std::vector<std::string>& command : std::initializer_list<std::vector<std::string>>{
                 {"convert", bad.input, "-o", "out.aiff"},
                 {"waveform", bad.input, "-o", "out.png"},
                 {"info", bad.input},
             }) {
            const std::string message = fail(command);
            expectMessage(message, {start, bad.reason});
            EXPECT_GT(message.size(), start.size() + 5) << message;
            // The name is not repeated.
            EXPECT_EQ(message.find(std::string(bad.input) + ":", start.size()), std::string::npos) << message;
            EXPECT_FALSE(has(message, folder.path().string()));
        }
    }
    EXPECT_EQ(list(), before);
    ::chmod((folder / "sound.xyz").c_str(), 0);
    for (const char* command :
         {"info", "waveform -o out.png", "burn --image x.iso", "tag cover import out.flac -i"})
        EXPECT_TRUE(has(
            run(withoutPrivileges(with(with({kProgram}, words(command)), {"sound.xyz"})), folder.path()).err,
            "sound.xyz: Permission denied\n"))
            << command;
}

TEST_F(BadOutput, IsToldByNameAndReason) {
    write("in.wav", makeTone(44100, 1, 16, 0.1));
    std::filesystem::create_directory(folder / "folder.flac");
    folder.write("file", "a file");
    ASSERT_EQ(::mkfifo((folder / "pipe.flac").c_str(), 0600), 0);
    const auto before = list();
    static const struct {
        const char* output;
        std::vector<std::string> parts;
    } kCases[] = {
        {"missing/out.flac", {"missing", "does not exist"}},
        {"file/out.flac", {"is not a folder"}},
        {"folder.flac", {"folder.flac", "Is a directory"}},
        {"pipe.flac", {"pipe.flac", "not a regular file"}},
        {"out.xyz", {"No plug-in writes .xyz files"}},
        {"out", {"No plug-in writes files without an extension"}},
        {"/proc/out.flac", {"/proc"}},
        {"in.wav", {"same file"}},
        {"./folder.flac/../in.wav", {"same file"}},
    };
    for (const auto& bad : kCases) {
        SCOPED_TRACE(bad.output);
        const std::string message = fail({"convert", "in.wav", "-f", "-o", bad.output});
        expectMessage(message, bad.parts);
        if (bad.output == std::string("/proc/out.flac")) continue; // known only when it is opened
        expectMessage(fail({"convert", "in.wav", "-n", "-f", "-o", bad.output}), bad.parts);
    }
    expectMessage(fail({"convert", "in.wav", "-n", "--to", "au", "--directory", "file/out"}),
                  {"file is not a folder"});
    EXPECT_EQ(tonewright({"convert", "in.wav", "-n", "-o", "-", "--to", "au"}).err, "in.wav -> -\n");
    std::filesystem::create_directory(folder / "locked");
    ::chmod((folder / "locked").c_str(), 0555);
    EXPECT_TRUE(has(run(withoutPrivileges({kProgram, "convert", "in.wav", "-n", "-o", "locked/a.flac"}),
                        folder.path(), programEnvironment())
                        .err,
                    "locked cannot be written to\n"));
    std::filesystem::remove(folder / "locked");
    for (const auto& [output, part] : std::initializer_list<std::pair<const char*, const char*>>{
             {"missing/out.png", "does not exist"}, {"folder.flac", "Is a directory"}, {"in.wav", "same"}})
        expectMessage(fail({"waveform", "in.wav", "-f", "-o", output}), {part});
    EXPECT_EQ(list(), before);
    write("five.wav", makeTone(44100, 5, 16, 0.1)); // cannot be mixed down to the channels of MP3
    expectMessage(fail({"convert", "five.wav", "-o", "out.mp3"}),
                  {"5 channels and", "to 44100 Hz, 2 channels"});
}

TEST_F(BadOutput, LosesNothing) {
    write("in.wav", makeTone(44100, 1, 16, 0.1));
    folder.write("bad.wav", "RIFFxxxxWAVEfmt and no more");
    folder.write("out.flac", "precious");
    folder.write("out.png", "precious");
    expectMessage(fail({"convert", "in.wav", "-o", "out.flac"}), {"out.flac", "exists", "--force"});
    fail({"convert", "bad.wav", "-f", "-o", "out.flac"});
    expectMessage(fail({"waveform", "in.wav", "-o", "out.png"}), {"out.png", "exists", "--force"});
    fail({"waveform", "bad.wav", "-f", "-o", "out.png"});
    EXPECT_EQ(readFile(folder / "out.flac") + readFile(folder / "out.png"), "preciousprecious");
}

// A file size limit represents all failures in the middle of writing.
TEST_F(BadOutput, MayFailInTheMiddle) {
    write("in.wav", makeNoise(44100, 2, 16, 200000));
    for (const char* output : {"out.flac", "out.wav", "out.aiff", "out.ogg", "out.mp3"})
        for (bool existing : {false, true}) {
            SCOPED_TRACE(output);
            if (existing) folder.write(output, "precious");
            const auto before = list();
            const SProcessResult result =
                run({"sh", "-c", "ulimit -f 40; exec timeout -s KILL 60 \"$0\" convert in.wav -f -o \"$1\"",
                     kProgram, output},
                    folder.path(), programEnvironment());
            EXPECT_EQ(result.exitCode, 1) << result.err;
            expectMessage(result.err, {"tonewright: in.wav: ", output, "File too large"});
            EXPECT_FALSE(has(result.err, ".part"));
            EXPECT_EQ(list(), before);
            if (existing) {
                EXPECT_EQ(readFile(folder / output), "precious");
            }
        }
}

TEST_F(BadOutput, MayFillTheDisk) {
    write("in.wav", makeNoise(44100, 2, 16, 200000));
    std::filesystem::create_directory(folder / "disk");
    const std::string script = "mount -t tmpfs -o size=128k none disk || exit 77\n"
                               "echo precious > disk/out.flac\n"
                               "timeout -s KILL 60 \"$0\" convert in.wav -f -o disk/out.flac\n"
                               "echo $?; cat /dev/zero > disk/full 2>&-\n"
                               "timeout -s KILL 60 \"$0\" waveform in.wav -o disk/out.png\n"
                               "echo $?; ls -A disk; cat disk/out.flac";
    const SProcessResult result =
        run({"unshare", "-rm", "sh", "-c", script, kProgram}, folder.path(), programEnvironment());
    if (result.out.empty()) GTEST_SKIP() << "no small disk can be mounted here: " << result.err;
    EXPECT_EQ(result.out, "1\n1\nfull\nout.flac\nprecious\n");
    EXPECT_EQ(result.err, "tonewright: in.wav: Could not write disk/out.flac: No space left on device\n"
                          "tonewright: in.wav: Could not write disk/out.png: No space left on device\n");
}

TEST_F(BadOutput, MayHaveNoFolderAnyMore) {
    const std::string input = (folder / "in.wav").string();
    write("in.wav", makeTone(8000, 1, 16, 0.1));
    const SProcessResult result =
        run({"sh", "-c", "mkdir gone; cd gone; rmdir ../gone; exec \"$0\" convert \"$1\" -o out.flac",
             kProgram, input},
            folder.path(), programEnvironment());
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.err, "tonewright: The current folder does not exist\n");
}

TEST_F(BadInput, MayBeNoise) {
    std::mt19937 random(7);
    std::vector<std::string> command{"convert", "--json", "--directory", "out", "--to", "au"};
    std::filesystem::create_directory(folder / "out");
    std::string noise(65536, '\0');
    std::istringstream extensions(succeed({"formats"}));
    size_t count = 0;
    for (std::string extension; std::getline(extensions, extension); ++count) {
        for (char& byte : noise) byte = static_cast<char>(random());
        folder.write(extension + "." + extension, noise);
        command.push_back(extension + "." + extension);
    }
    EXPECT_GE(count, 10u);
    const SProcessResult result = tonewright(command);
    EXPECT_EQ(result.exitCode, 1) << result.err;
    size_t errors = 0;
    for (const nlohmann::json& event : parseLines(result.out)) {
        errors += event["event"] == "error";
        // MPEG audio has only a few header bits, which also occur in noise.
        if (event["event"] == "done") {
            EXPECT_EQ(event["input"].get<std::string>().substr(0, 2), "mp");
        }
    }
    EXPECT_GE(errors, count - 3);
}

TEST_F(BadOutput, BelongsToTheFirstOfTwoInputs) {
    for (const char* name : {"a", "b", "out"}) std::filesystem::create_directory(folder / name);
    write("a/x.wav", makeTone(44100, 1, 16, 0.1));
    write("b/x.wav", makeTone(48000, 1, 16, 0.1));
    const std::string message =
        fail({"convert", "-f", "a/x.wav", "b/x.wav", "a/x.wav", "--to", "wav", "--directory", "out"});
    EXPECT_EQ(std::count(message.begin(), message.end(), '\n'), 2) << message;
    EXPECT_NE(message.find("tonewright: b/x.wav: "), std::string::npos) << message;
    EXPECT_EQ(readWav("out/x.wav").rate, 44100);
}
