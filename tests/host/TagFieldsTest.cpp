// All fields, pictures and names of files, in every format with tags.
#include "host/Program.h"

#include <gmock/gmock.h>

using namespace tests;

namespace {

const std::vector<std::string> kTagged{"flac", "mp3", "ogg", "oga", "opus", "m4a", "wma", "aiff", "wav"};

class TagFields : public CProgramTest {
protected:
    void makeSound(const std::string& name) {
        peer({"ffmpeg", "-v", "error", "-y", "-f", "lavfi", "-i", "sine=d=0.3:r=48000", "-map_metadata", "-1",
              "-fflags", "+bitexact", name});
    }
    void makePicture(const std::string& name, const std::string& size) {
        peer({"ffmpeg", "-v", "error", "-y", "-f", "lavfi", "-i", "color=red:s=" + size, "-frames:v", "1",
              name});
    }
    nlohmann::json showAll(const std::string& name) {
        return parseLines(succeed({"tag", "show", "--all", "--json", "--", name})).at(0);
    }
    nlohmann::json show(const std::string& name) {
        return parseLines(succeed({"tag", "show", "--json", "--", name})).at(0);
    }
    // The texts of a tag according to the peer.
    std::string judge(const std::string& name) {
        return peer({"/usr/bin/python3", "-c",
                     "import sys, mutagen\nprint(mutagen.File(sys.argv[1]).tags.pprint())", name});
    }
};

} // namespace

TEST_F(TagFields, AreWrittenUnderAnyNameInEveryFormat) {
    for (const std::string& extension : kTagged) {
        SCOPED_TRACE(extension);
        const std::string name = "a." + extension;
        makeSound(name);
        const std::vector<std::string> command =
            words("tag set " + name +
                  " --title T\xc3\xbc --track 3/12 --album A --year 1999 --comment c "
                  "--field COMPOSER=One --field=composer=Two --field MOOD=a=b");
        EXPECT_EQ(succeed(command), name + ": changed\n");
        EXPECT_EQ(succeed(command), name + ": unchanged\n");
        const nlohmann::json shown = show(name);
        for (const auto& [key, text] : std::map<std::string, std::string>{{"title", "T\xc3\xbc"},
                                                                          {"track", "3/12"},
                                                                          {"album", "A"},
                                                                          {"year", "1999"},
                                                                          {"comment", "c"},
                                                                          {"artist", ""}})
            EXPECT_EQ(shown[key], text) << key;
        const nlohmann::json fields = showAll(name)["fields"];
        EXPECT_EQ(fields["COMPOSER"], nlohmann::json({"One", "Two"}));
        EXPECT_EQ(fields["MOOD"], nlohmann::json({"a=b"}));
        const std::string seen = judge(name);
        for (const char* text : {"T\xc3\xbc", "One", "Two", "a=b", "3", "1999"})
            EXPECT_THAT(seen, testing::HasSubstr(text));
        EXPECT_EQ(succeed({"tag", "set", name, "--field", "mood=", "--clear", "comment", "--artist", "B"}),
                  name + ": changed\n");
        EXPECT_FALSE(showAll(name)["fields"].contains("MOOD"));
        EXPECT_EQ(show(name)["artist"].get<std::string>() + show(name)["comment"].get<std::string>(), "B");
    }
    const std::string before = readFile(folder / "a.m4a");
    EXPECT_THAT(fail({"tag", "set", "a.m4a", "--title", "U", "--track", "A1"}),
                testing::HasSubstr("'TRACKNUMBER' cannot be stored"));
    EXPECT_EQ(readFile(folder / "a.m4a"), before) << "all that was asked for, or nothing";
    // Players read one of the two names of a comment.
    peer({"ffmpeg", "-v", "error", "-y", "-i", "a.opus", "-metadata", "description=old", "b.opus"});
    succeed({"tag", "set", "b.opus", "--comment", "new"});
    EXPECT_EQ(show("b.opus")["comment"], "new");
    EXPECT_FALSE(showAll("b.opus")["fields"].contains("DESCRIPTION"));
}

TEST_F(TagFields, OfAWaveFileWithoutPadBytesAllStay) {
    write("a.wav", makeTone(8000, 1, 16, 0.1));
    run({kProgram, "tag", "set", "a.wav", "--title", "even", "--artist", "odd", "--genre", "more", "--year",
         "1999"},
        folder.path(), {{"TONEWRIGHT_PAD_INFO", "0"}});
    succeed({"tag", "set", "a.wav", "--field", "COMPOSER=C"});
    const nlohmann::json fields = showAll("a.wav")["fields"];
    for (const auto& [key, text] : std::map<std::string, std::string>{
             {"TITLE", "even"}, {"ARTIST", "odd"}, {"GENRE", "more"}, {"DATE", "1999"}, {"COMPOSER", "C"}})
        EXPECT_EQ(fields.value(key, nlohmann::json()), nlohmann::json({text})) << key;
}

TEST_F(TagFields, AreShownOnOneLineEach) {
    makeSound("a.flac");
    peer({"metaflac", "--set-tag=ARTIST=One", "--set-tag=ARTIST=Two", "--set-tag=MUSICBRAINZ_ALBUMID=x\ny",
          "a.flac"});
    makePicture("front.png", "64x48");
    succeed({"tag", "cover", "import", "a.flac", "-i", "front.png"});
    EXPECT_THAT(succeed({"tag", "show", "--all", "a.flac"}),
                testing::MatchesRegex("a.flac\n  ARTIST        One\n  ARTIST        Two\n(  ENCODER .*\n)?  "
                                      "MUSICBRAINZ_ALBUMID x.x0ay\n"
                                      "  .picture.     front, image/png, 64x48, [0-9]+ B\n"));
}

TEST_F(TagFields, AreCopiedFromFileToFile) {
    makeSound("a.flac");
    makePicture("front.png", "8x8");
    succeed({"tag", "set", "a.flac", "--title", "T", "--field", "COMPOSER=C"});
    succeed({"tag", "cover", "import", "a.flac", "-i", "front.png"});
    makeSound("b.mp3");
    makeSound("c.m4a");
    makeSound("d.au");
    succeed({"tag", "set", "b.mp3", "--genre", "Jazz"});
    const SProcessResult result = tonewright({"tag", "copy", "a.flac", "b.mp3", "d.au", "a.flac", "c.m4a"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.out, "b.mp3: copied\nc.m4a: copied\n");
    EXPECT_EQ(
        result.err,
        "tonewright: d.au: No tag is known for .au files\ntonewright: a.flac: Is the file to copy from\n");
    for (const char* name : {"b.mp3", "c.m4a"}) {
        EXPECT_EQ(showAll(name)["fields"]["COMPOSER"], nlohmann::json({"C"}));
        EXPECT_EQ(showAll(name)["pictures"].size(), 1u);
    }
    EXPECT_EQ(show("b.mp3")["genre"], "Jazz");
    EXPECT_EQ(succeed({"tag", "copy", "--json", "a.flac", "b.mp3"}), "{\"file\":\"b.mp3\",\"lost\":\"\"}\n");
    EXPECT_THAT(fail({"tag", "copy", "missing.flac", "b.mp3"}),
                testing::HasSubstr("The tag of missing.flac cannot be read: This file was not found"));
}

TEST_F(TagFields, CoversComeAndGoInEveryFormat) {
    makePicture("front.png", "64x48");
    makePicture("back.jpg", "48x64");
    folder.write("text.jpg", "no picture");
    for (const std::string& extension : kTagged) {
        SCOPED_TRACE(extension);
        const std::string name = "a." + extension;
        makeSound(name);
        EXPECT_THAT(fail({"tag", "cover", "export", name, "-o", "x.png"}),
                    testing::HasSubstr("Has no picture\n"));
        for (const char* picture : {"back.jpg", "front.png"}) // replaces the other
            EXPECT_EQ(succeed({"tag", "cover", "import", name, "-i", picture}), name + ": changed\n");
        const nlohmann::json shown = showAll(name)["pictures"];
        ASSERT_EQ(shown.size(), 1u);
        EXPECT_EQ(shown[0], (nlohmann::json{{"type", "front"},
                                            {"mime_type", "image/png"},
                                            {"width", 64},
                                            {"height", 48},
                                            {"bytes", readFile(folder / "front.png").size()},
                                            {"description", ""}}));
        succeed({"tag", "cover", "import", name, "-i", "back.jpg", "--type", "back"});
        if (extension != "wav" && extension != "oga") {
            EXPECT_THAT(peer({"ffprobe", "-v", "error", "-show_entries", "stream=width", "-of", "csv", name}),
                        testing::HasSubstr("64"));
        }
        // The pictures of MP4 have no types: the last one comes first.
        if (extension == "m4a") continue;
        if (extension == "flac") {
            const std::string size = std::to_string(readFile(folder / "front.png").size()),
                              front = "front, image/png, 64x48, " + size + " B\n";
            const std::vector<std::string> command{"tag", "cover", "export", name, "-f", "-o", "x"};
            EXPECT_THAT(succeed({"tag", "cover", "show", name}),
                        testing::MatchesRegex("a.flac\n  back, image/jpeg, 48x64, [0-9]+ B\n  " + front));
            EXPECT_TRUE(has(succeed({"tag", "cover", "show", name, "--json"}), shown[0].dump()));
            EXPECT_EQ(succeed(command), "x: " + front);
            EXPECT_EQ(parseLines(succeed(with(command, {"--json"}))).at(0),
                      (nlohmann::json{{"file", name}, {"output", "x"}, {"picture", shown[0]}}));
            EXPECT_THAT(fail(with(command, {"--type", "media"})),
                        testing::HasSubstr("Has no picture of type media\n"));
            succeed({"tag", "cover", "remove", name, "--type", "front"});
            EXPECT_THAT(succeed(command), testing::StartsWith("x: back, ")) << "the first one";
            succeed({"tag", "cover", "import", name, "-i", "front.png"});
        }
        for (const auto& [type, picture] :
             std::map<std::string, std::string>{{"front", "front.png"}, {"back", "back.jpg"}}) {
            succeed({"tag", "cover", "export", name, "-f", "-o", "x", "--type", type});
            EXPECT_TRUE(readFile(folder / "x") == readFile(folder / picture)) << type;
        }
        EXPECT_THAT(fail({"tag", "cover", "export", name, "-o", "x"}), testing::HasSubstr("exists"));
        fail({"tag", "cover", "import", name, "-i", "text.jpg"});
        succeed({"tag", "cover", "remove", name, "--type", "back"});
        EXPECT_EQ(showAll(name)["pictures"], shown);
        EXPECT_EQ(succeed({"tag", "cover", "remove", name}), name + ": changed\n");
        EXPECT_EQ(succeed({"tag", "cover", "show", name}), name + "\n  (none)\n");
    }
}

TEST_F(TagFields, ComeFromNames) {
    std::filesystem::create_directories(folder / "Artist/Album");
    makeSound("Artist/Album/03 - Some - thing.mp3");
    makeSound("other.opus");
    const std::string file = "Artist/Album/03 - Some - thing.mp3",
                      pattern = "%artist%/%album%/%track% - %title%", before = readFile(folder / file);
    EXPECT_THAT(succeed({"tag", "from-name", "-n", "-p", pattern, file}),
                testing::HasSubstr("  title         Some - thing\n"));
    EXPECT_EQ(succeed({"tag", "from-name", "-n", "--json", "-p", pattern, file}),
              "{\"album\":\"Album\",\"artist\":\"Artist\",\"file\":\"" + file +
                  "\",\"title\":\"Some - thing\",\"track\":\"3\"}\n");
    EXPECT_TRUE(readFile(folder / file) == before);
    const SProcessResult result = tonewright({"tag", "from-name", "-p", pattern, "other.opus", file});
    EXPECT_EQ(result.out, file + ": changed\n");
    EXPECT_EQ(result.err, "tonewright: other.opus: The name does not match the pattern\n");
    const nlohmann::json shown = show(file);
    EXPECT_EQ(shown["artist"], "Artist");
    EXPECT_EQ(shown["album"], "Album");
    EXPECT_EQ(shown["track"], "3");
    EXPECT_EQ(shown["title"], "Some - thing");
    std::filesystem::rename(folder / file, folder / "Artist/Album/plain.mp3");
    // Without a folder in the name, the current one counts.
    EXPECT_EQ(
        run({"sh", "-c", "cd Artist/Album && \"$0\" tag from-name -p '%genre%/%title%' plain.mp3", kProgram},
            folder.path())
            .out,
        "plain.mp3: changed\n");
    EXPECT_EQ(show("Artist/Album/plain.mp3")["genre"], "Album");
}

TEST_F(TagFields, NameFilesWithoutReplacingAny) {
    for (const char* name : {"1.mp3", "2.mp3", "3.wav", "4.mp3"}) makeSound(name);
    succeed({"tag", "set", "1.mp3", "2.mp3", "--artist", "AC/DC", "--title", "../T", "--track", "3/12"});
    succeed({"tag", "set", "4.mp3", "--title", "4"});
    const std::vector<std::string> command{"tag",   "rename", "-p",   "%artist%/%track% %title%",
                                           "1.mp3", "2.mp3",  "3.wav"};
    std::vector<std::string> dry = command;
    dry.push_back("-n");
    const auto before = list();
    for (const std::vector<std::string>& each : {dry, command}) {
        const SProcessResult result = tonewright(each);
        EXPECT_EQ(result.exitCode, 1);
        EXPECT_EQ(result.out, "1.mp3 -> AC-DC/03 ..-T.mp3\n3.wav -> Unknown Artist/00 3.wav\n");
        EXPECT_EQ(result.err, "tonewright: 2.mp3: AC-DC/03 ..-T.mp3 exists\n");
        if (each == dry) {
            EXPECT_EQ(list(), before);
        }
    }
    EXPECT_EQ(list(), (std::set<std::string>{"2.mp3", "4.mp3", "AC-DC/", "AC-DC/03 ..-T.mp3",
                                             "Unknown Artist/", "Unknown Artist/00 3.wav"}));
    EXPECT_EQ(succeed({"tag", "rename", "-p", "%title%", "4.mp3"}), "4.mp3: unchanged\n");
    EXPECT_EQ(parseLines(succeed({"tag", "rename", "--json", "-p", "%title%", "-d", "AC-DC", "4.mp3"})).at(0),
              (nlohmann::json{{"file", "4.mp3"}, {"target", "AC-DC/4.mp3"}, {"renamed", true}}));
    // Folders made in vain are removed: for a name, then for a path that is too long.
    std::string folders;
    for (int i = 0; i < 16; ++i) folders += std::string(240, 'n') + "/";
    const auto names = list();
    for (const std::string& pattern :
         {folders + std::string(237, 'm') + "/%title%", folders + folders + "%title%"}) {
        fail({"tag", "rename", "-p", pattern, "2.mp3"});
        EXPECT_EQ(list(), names);
    }
    folder.write("blocked", "a file");
    EXPECT_THAT(fail({"tag", "rename", "-p", "blocked/%title%", "2.mp3"}), testing::HasSubstr("blocked"));
}
