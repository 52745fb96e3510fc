#include "support/Process.h"
#include "support/TempFolder.h"

namespace {

using namespace tests;

TEST(Examples, Covers_AddsListsAndExtractsWhatPeersSee) {
    CTempFolder folder;
    const auto succeed = [&](const std::vector<std::string>& command) {
        const SProcessResult result = run(command, folder.path());
        EXPECT_EQ(result.exitCode, 0) << command[0] << ": " << result.out << result.err;
        return result.out;
    };
    for (const char* picture : {"red.png", "blue.jpg"})
        succeed({"ffmpeg", "-v", "error", "-f", "lavfi", "-i",
                 "color=" + std::string(picture).substr(0, std::string(picture).find('.')) + ":s=64x64",
                 "-frames:v", "1", picture});
    const std::string red = readFile(folder / "red.png"), blue = readFile(folder / "blue.jpg");
    const std::string listed = "0 front image/png " + std::to_string(red.size()) + "\n1 front image/jpeg " +
                               std::to_string(blue.size()) + "\n";
    for (const std::string file : {"a.flac", "a.mp3"}) {
        SCOPED_TRACE(file);
        succeed({"ffmpeg", "-v", "error", "-f", "lavfi", "-i", "sine=d=0.2", file});
        EXPECT_EQ(succeed({COVERS, "list", file}), "");
        succeed({COVERS, "add", file, "red.png"});
        succeed({COVERS, "add", file, "blue.jpg"});
        EXPECT_EQ(succeed({COVERS, "list", file}), listed);
        succeed({COVERS, "extract", file, "1", "out.jpg"});
        EXPECT_EQ(readFile(folder / "out.jpg"), blue);
        EXPECT_EQ(run({COVERS, "extract", file, "2", "none.jpg"}, folder.path()).exitCode, 1);
    }
    succeed({"metaflac", "--export-picture-to=judge.png", "a.flac"});
    EXPECT_EQ(readFile(folder / "judge.png"), red);
    succeed(
        {"/usr/bin/python3", "-c",
         "import mutagen\n"
         "pictures = mutagen.File('a.mp3').tags.getall('APIC')\n"
         "assert [(p.type, p.mime) for p in pictures] == [(3, 'image/png'), (3, 'image/jpeg')]\n"
         "assert [p.data for p in pictures] == [open(f, 'rb').read() for f in ('red.png', 'blue.jpg')]\n"});
    // A format without pictures, a text file and a missing file
    for (const char* file : {"a.wav", "a.txt", "missing.flac"}) {
        if (file == std::string("a.wav"))
            succeed({"ffmpeg", "-v", "error", "-f", "lavfi", "-i", "sine=d=0.2", file});
        const SProcessResult result = run({COVERS, "list", file}, folder.path());
        EXPECT_EQ(result.exitCode, 1) << file;
        EXPECT_NE(result.err.find(file), std::string::npos) << result.err;
    }
}

TEST(Examples, Tag_ShowsTheTitleAndChangesIt) {
    CTempFolder folder;
    const std::string file = (folder / "a.ogg").string();
    run({"ffmpeg", "-v", "error", "-f", "lavfi", "-i", "sine=d=0.2", "-metadata", "title=Before", file});
    EXPECT_EQ(run({TAG, file, "After"}).out, "Before\n");
    EXPECT_EQ(run({TAG, file, "Later"}).out, "After\n");
    EXPECT_EQ(run({TAG, (folder / "missing.ogg").string(), "x"}).exitCode, 1);
}

#ifndef TONEWRIGHT_SANITIZED // Python itself is not built for that
TEST(Examples, Python_ConvertsAndGivesTheReasonOfAFailure) {
    CTempFolder folder;
    run({"sox", "-n", "-r", "48000", "-b", "24", "-c", "1", folder / "a.wav", "synth", "1", "sine", "300"});
    const auto convert = [&](const std::string& from, const std::string& to) {
        return run({"/usr/bin/python3", CONVERT, folder / from, folder / to}, {},
                   {{"TONEWRIGHT_LIBDIR", LIBRARIES}});
    };
    const SProcessResult good = convert("a.wav", "a.flac");
    EXPECT_EQ(good.exitCode, 0) << good.err;
    EXPECT_NE(good.out.find("48000 Hz, 1 channels, 1.00 s"), std::string::npos) << good.out;
    EXPECT_NE(good.err.find("100%"), std::string::npos) << good.err;
    EXPECT_EQ(run({"flac", "-t", "-s", folder / "a.flac"}).exitCode, 0);
    EXPECT_EQ(run({"soxi", "-b", folder / "a.flac"}).out, "24\n");
    const SProcessResult bad = convert("missing.wav", "b.flac");
    EXPECT_EQ(bad.exitCode, 1);
    EXPECT_NE(bad.err.find("No such file"), std::string::npos) << bad.err;
}
#endif

} // namespace
