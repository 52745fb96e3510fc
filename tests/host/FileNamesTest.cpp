#include "host/Program.h"

using namespace tests;

using FileNames = CProgramTest;

// Every command reads, writes and prints each name.
TEST_F(FileNames, MayBeAnything) {
    const SSound sound = makeTone(8000, 1, 16, 0.2);
    const std::vector<std::string> names = {
        "100% %41%zz",
        "sharp#fragment",
        "question?query=1&x=2;y",
        "line\nbreak\ttab",
        "not \xff\xfe UTF-8 \xc3",
        "-leading",
        "--rate",
        "\xf0\x9f\x8e\xb5 \xe9\x9f\xb3\xe6\xa5\xbd \xc3\xbc",
        "quote ' \" ` $HOME \\ back",
        "(brackets) [square] {curly}, comma: colon!",
        "file:",
        ".hidden",
        "a.b.flac",
        "trailing. ",
        std::string(200, 'n'),
        std::string(250, 'n'), // the output's name has no room for a suffix
        std::string(249, 'n') + "m",
    };
    std::filesystem::create_directory(folder / "out \xff");
    std::vector<std::string> command{"convert", "--to", "flac", "--directory", "out \xff", "-j", "3", "--"};
    for (const std::string& name : names) {
        write(name + ".wav", sound);
        command.push_back(name + ".wav");
    }
    const std::string out = succeed(command);
    EXPECT_EQ(static_cast<size_t>(std::count(out.begin(), out.end(), '\n')), names.size());
    for (const std::string& name : names) {
        SCOPED_TRACE(name);
        const std::string flac = "out \xff/" + name + ".flac";
        succeed({"convert", "-f", "-o", "back.wav", "--", flac});
        EXPECT_TRUE(readWav("back.wav") == sound);
        succeed({"tag", "set", "--title", "T", "--", flac});
        EXPECT_EQ(parseLines(succeed({"tag", "show", "--json", "--", flac})).at(0)["title"], "T");
        EXPECT_EQ(parseLines(succeed({"info", "--json", "--", flac})).at(0)["rate"], 8000);
    }
    for (const std::string& name : list()) EXPECT_FALSE(has(name, ".part"));
}

TEST_F(FileNames, AreShownOnOneLine) {
    const std::string name = "line\nbreak\x1b[2J\x7f\xc2\x80\xc2\x9f\xc2\xa0\xc3\x85 \x1f.wav";
    folder.write(name, "no sound");
    const std::string message = fail({"info", name});
    EXPECT_EQ(message.find(
                  "tonewright: line\\x0abreak\\x1b[2J\\x7f\\xc2\\x80\\xc2\\x9f\xc2\xa0\xc3\x85 \\x1f.wav: "),
              0u)
        << message;
    EXPECT_EQ(std::count(message.begin(), message.end(), '\n'), 1) << message;
    // Also if the plug-in names the file, in whatever form
    folder.write("b\xff 50%25.flac", "no sound at all, and no format of sound either");
    for (const char* output : {"out.wav", "missing/\xff.wav"}) {
        const std::string reason = fail({"convert", "b\xff 50%25.flac", "-o", output});
        EXPECT_EQ(reason.find("tonewright: b\xff 50%25.flac: "), 0u) << reason;
    }
}

TEST_F(FileNames, MayBeAbsoluteOrGoUp) {
    std::filesystem::create_directories(folder / "a/b");
    write("a/in.wav", makeTone(8000, 1, 16, 0.1));
    succeed({"convert", "a/b/../in.wav", "-o", "./a/b/../b/out.flac"});
    succeed({"convert", (folder / "a/in.wav").string(), "--to", "flac"});
    EXPECT_EQ(readFile(folder / "a/b/out.flac"), readFile(folder / "a/in.flac"));
}
