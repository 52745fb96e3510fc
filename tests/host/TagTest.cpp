#include "host/Program.h"

#include <sys/stat.h>

#include <map>

using namespace tests;

namespace {

using Fields = std::map<std::string, std::string>; // by JSON key

const std::vector<std::string> kWritable{"flac", "mp3", "ogg", "wav"};

// Without fields that the file type does not support.
Fields makeFields(const std::string& extension, const std::string& mark = "") {
    Fields fields;
    for (const char* key : {"title", "artist", "album", "album_artist", "track", "year", "genre", "comment"})
        fields[key] = mark + key + " \xc3\xbc \xe9\x9f\xb3 \xf0\x9f\x8e\xb5";
    fields["track"] = "3/12";
    fields["year"] = "1999";
    if (extension == "wav") fields["album"] = fields["album_artist"] = "";
    return fields;
}

std::vector<std::string> toOptions(const Fields& fields) {
    std::vector<std::string> options;
    for (const auto& [key, text] : fields) {
        std::string option = "--" + key;
        std::replace(option.begin(), option.end(), '_', '-');
        if (!text.empty()) options.insert(options.end(), {option, text});
    }
    return options;
}

class Tag : public CProgramTest {
protected:
    void makeSound(const std::string& name, const Fields& fields = {}) {
        std::vector<std::string> command{"ffmpeg", "-v", "error", "-y", "-f", "lavfi", "-i", "sine=d=0.3"};
        for (const auto& [key, text] : fields)
            command.insert(command.end(), {"-metadata", (key == "year" ? "date" : key) + "=" + text});
        command.push_back(name);
        peer(command);
    }
    // As read by the peer, by the same keys.
    Fields probe(const std::string& name) {
        const nlohmann::json told = nlohmann::json::parse(peer(
            {"ffprobe", "-v", "error", "-of", "json", "-show_entries", "format_tags:stream_tags", name}));
        Fields fields = makeFields("");
        for (auto& [key, text] : fields) text.clear();
        const auto add = [&](const nlohmann::json& tags) {
            for (auto& [key, text] : fields)
                for (const auto& [theirs, value] : tags.items()) {
                    std::string lower = theirs;
                    std::transform(lower.begin(), lower.end(), lower.begin(), ::tolower);
                    if (lower == "date" || lower == "wm/year") lower = "year";
                    if (lower == "trck") lower = "track"; // in WAV files
                    if (lower == key) text = value;
                }
        };
        if (told.contains("format")) add(told["format"].value("tags", nlohmann::json::object()));
        for (const auto& stream : told.value("streams", nlohmann::json::array()))
            add(stream.value("tags", nlohmann::json::object()));
        return fields;
    }
    Fields show(const std::string& name) {
        nlohmann::json line = parseLines(succeed({"tag", "show", "--json", "--", name})).at(0);
        EXPECT_EQ(line["file"], name);
        line.erase("file");
        return line;
    }
    std::string set(const std::string& name, std::vector<std::string> options) {
        options.insert(options.begin(), {"tag", "set"});
        options.insert(options.end(), {"--", name});
        return succeed(options);
    }
    std::string hearSound(const std::string& name) {
        return peer({"ffmpeg", "-v", "error", "-i", name, "-map", "0:a", "-f", "md5", "-"});
    }
};

} // namespace

TEST_F(Tag, IsWrittenForPeersAndReadFromThem) {
    for (const char* extension : {"flac", "mp3", "ogg", "wav", "wma"}) {
        SCOPED_TRACE(extension);
        const Fields fields = makeFields(extension), others = makeFields(extension, "peer ");
        const std::string ours = std::string("ours.") + extension,
                          theirs = std::string("theirs.") + extension;
        makeSound(ours);
        const std::string sound = hearSound(ours);
        EXPECT_EQ(set(ours, toOptions(fields)), ours + ": changed\n");
        EXPECT_EQ(probe(ours), fields);
        EXPECT_EQ(show(ours), fields);
        EXPECT_EQ(hearSound(ours), sound);

        // The peer stores some fields in places where no other program looks for them.
        Fields given = others, read;
        std::string strange = extension == std::string("wav")   ? "track"
                              : extension == std::string("mp3") ? "comment"
                              : extension == std::string("wma") ? "comment year"
                                                                : "";
        makeSound(theirs, given);
        for (const auto& [key, text] : show(theirs))
            if (strange.find(key) == std::string::npos) read[key] = text;
        std::erase_if(given,
                      [&](const auto& field) { return strange.find(field.first) != std::string::npos; });
        EXPECT_EQ(read, given);
    }
}

TEST_F(Tag, IsShownFieldByField) {
    makeSound("a.flac", {{"title", "T"}, {"album_artist", "AA"}, {"comment", "two\nlines\x1b[2J"}});
    makeSound("b.wav");
    EXPECT_EQ(succeed({"tag", "show", "a.flac", "b.wav"}), "a.flac\n"
                                                           "  title         T\n"
                                                           "  album artist  AA\n"
                                                           "  comment       two\\x0alines\\x1b[2J\n"
                                                           "b.wav\n"
                                                           "  (empty)\n");
}

TEST_F(Tag, KeepsWhatIsNotNamedAndLeavesAnUnchangedFileAlone) {
    for (const std::string& extension : kWritable) {
        SCOPED_TRACE(extension);
        const std::string name = "a." + extension;
        makeSound(name);
        Fields fields = makeFields(extension);
        set(name, toOptions(fields));
        const auto identify = [&] {
            struct stat status = {};
            ::stat((folder / name).c_str(), &status);
            return std::tuple(status.st_ino, status.st_mtim.tv_sec, status.st_mtim.tv_nsec);
        };
        const auto before = identify();
        EXPECT_EQ(set(name, toOptions(fields)), name + ": unchanged\n");
        EXPECT_EQ(identify(), before);
        set(name, {"--title=-x", "--clear", "genre", "--clear", "year"});
        fields["title"] = "-x";
        fields["genre"] = fields["year"] = "";
        EXPECT_EQ(show(name), fields);
        EXPECT_EQ(probe(name), fields);
        set(name, {"--artist", "only", "--clear", "all"});
        for (auto& [key, text] : fields) text = key == "artist" ? "only" : "";
        EXPECT_EQ(probe(name), fields);
        EXPECT_EQ(set(name, {"--title=", "--album", "", "--clear", "comment"}), name + ": unchanged\n");
    }
}

TEST_F(Tag, TellsEachFileThatFailsAndDoesTheOthers) {
    makeSound("a.flac");
    makeSound("b.mp3");
    makeSound("c.wav");
    makeSound("x.au");
    folder.write("bad.flac", "this is no sound file at all");
    folder.write("empty.mp3", "");
    const std::vector<std::string> files{"x.au", "bad.flac", "a.flac",       "empty.mp3", "missing.ogg",
                                         ".",    "c.wav",    "no-extension", "b.mp3"};
    const auto command = [&](std::vector<std::string> start) {
        start.insert(start.end(), files.begin(), files.end());
        return start;
    };
    const std::string message = fail(command({"tag", "set", "--album", "A", "--title", "T"}));
    EXPECT_EQ(message, "tonewright: x.au: No tag is known for .au files\n"
                       "tonewright: bad.flac: The format of this file is not supported\n"
                       "tonewright: empty.mp3: The file is empty\n"
                       "tonewright: missing.ogg: No such file or directory\n"
                       "tonewright: .: Is a directory\n"
                       "tonewright: no-extension: No such file or directory\n");
    for (const char* done : {"a.flac", "b.mp3", "c.wav"}) {
        EXPECT_EQ(probe(done)["title"], "T");
        EXPECT_EQ(probe(done)["album"], "A");
    }
    const SProcessResult result = tonewright(command({"tag", "set", "--json", "--title", "U"}));
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.err, "");
    const std::vector<nlohmann::json> lines = parseLines(result.out);
    ASSERT_EQ(lines.size(), files.size());
    for (size_t i = 0; i < files.size(); ++i) {
        EXPECT_EQ(lines[i]["file"], files[i]);
        const bool isSound = files[i] == "a.flac" || files[i] == "b.mp3" || files[i] == "c.wav";
        EXPECT_EQ(lines[i].value("changed", false), isSound) << lines[i];
        EXPECT_EQ(lines[i].contains("error"), !isSound) << lines[i];
    }
    EXPECT_EQ(parseLines(tonewright(command({"tag", "show", "--json"})).out).size(), files.size());
}

TEST_F(Tag, RefusesWhatCannotBeMeant) {
    makeSound("a.flac");
    const std::string before = readFile(folder / "a.flac");
    for (const std::vector<std::string>& command : commands(
             "tag;tag a.flac;tag show;tag set a.flac;tag set --title T;tag set a.flac --clear colour;tag "
             "copy a.flac;"
             "tag set a.flac --title T --clear title;tag set a.flac --title \xff;tag set a.flac --field "
             "COMPOSER;"
             "tag set a.flac --field =x;tag set a.flac --field \xc3\xbc=x;tag cover a.flac;tag cover export "
             "a.flac;"
             "tag cover remove a.flac --type hat;tag rename a.flac;tag rename a.flac --pattern %colour%;"
             "tag from-name a.flac --pattern %artist%%title%;tag set a.flac --title half-a-pair\xed\xa0\xb5;"
             "tag set a.flac --title too-long\xf0\x80\x80\x80")) {
        const SProcessResult result = tonewright(command);
        EXPECT_EQ(result.exitCode, 2) << testing::PrintToString(command) << result.out;
        EXPECT_NE(result.err, "");
    }
    EXPECT_EQ(readFile(folder / "a.flac"), before);
}

TEST_F(Tag, IsCarriedByConversions) {
    makeSound("plain.flac");
    makeSound("tagged.flac");
    set("tagged.flac", toOptions(makeFields("flac")));
    for (const std::string& to : kWritable) {
        succeed({"convert", "tagged.flac", "-o", "out." + to});
        Fields expected = makeFields("flac");
        if (to == "wav") expected["album_artist"] = "";
        EXPECT_EQ(probe("out." + to), expected) << to;
    }
    succeed({"convert", "tagged.flac", "-f", "-o", "out.mp3", "--no-tags"});
    EXPECT_EQ(probe("out.mp3")["title"], "");
    succeed({"convert", "tagged.flac", "-o", "out.aiff"});
    succeed({"convert", "out.aiff", "-o", "back.flac"});
    EXPECT_EQ(probe("back.flac"), probe("tagged.flac"));
    // File types without tags, as target and as source
    for (const char* name : {"out.au", "out.caf", "out.w64", "out.rf64"}) {
        const SProcessResult result = tonewright({"convert", "tagged.flac", "-o", name});
        EXPECT_EQ(result.exitCode, 0);
        EXPECT_TRUE(has(result.err, "cannot hold these fields of the tag: ALBUM, ALBUMARTIST, ARTIST"));
        succeed({"convert", name, "-f", "-o", "back.flac"});
        EXPECT_EQ(probe("back.flac"), probe("plain.flac"));
    }
    succeed({"convert", "out.rf64", "-f", "-o", "out.wav"});
    std::filesystem::rename(folder / "out.rf64", folder / "wide.wav");
    succeed({"convert", "wide.wav", "-f", "-o", "back.flac"});
    for (const std::string& name : list()) EXPECT_FALSE(has(name, ".part"));
}

// The sound fits within the file size limit, the tag does not.
TEST_F(Tag, ThatCannotBeWrittenFailsTheConversion) {
    write("in.wav", makeTone(8000, 1, 16, 0.5));
    succeed({"convert", "in.wav", "-o", "in.flac"});
    set("in.flac", {"--comment", std::string(60000, 'c')});
    folder.write("out.mp3", "precious");
    const auto before = list();
    for (const char* output : {"out.flac", "out.mp3", "out.ogg", "out.wav"}) {
        const SProcessResult result =
            run({"sh", "-c", "ulimit -f 60; exec timeout -s KILL 60 \"$0\" convert in.flac -f -o \"$1\"",
                 kProgram, output},
                folder.path(), programEnvironment());
        EXPECT_EQ(result.exitCode, 1) << output;
        EXPECT_EQ(result.err.find("tonewright: in.flac: The tag of " + std::string(output) +
                                  " could not be written: "),
                  0u)
            << result.err;
        EXPECT_TRUE(has(result.err, "File too large"));
        EXPECT_FALSE(has(result.err, ".part"));
        EXPECT_EQ(list(), before);
    }
    EXPECT_EQ(readFile(folder / "out.mp3"), "precious");
}

// On a read-only file system, and on one without room for the second copy that a safe store needs.
TEST_F(Tag, SurvivesADiskThatCannotBeWrittenTo) {
    write("in.wav", makeNoise(44100, 2, 16, 20000)); // 80 kB
    peer({"flac", "-s", "--no-padding", "-o", "in.flac", "in.wav"});
    const std::string script =
        "mkdir full locked\n"
        "mount -t tmpfs -o size=128k none full || exit 77\n"
        "cp in.flac full/a.flac; cp in.wav full/a.wav 2>&- || rm full/a.wav\n"
        "mount -t tmpfs none locked; cp in.flac in.wav locked; mount -o remount,ro locked\n"
        "for file in full/a.flac locked/in.flac locked/in.wav; do\n"
        "  timeout -s KILL 60 \"$0\" tag set --title \"$1\" $file; echo $?\n"
        "done\n"
        "cmp in.flac full/a.flac && ls -A full && cmp in.wav locked/in.wav && ls -A locked";
    const SProcessResult result =
        run({"unshare", "-rm", "sh", "-c", script, kProgram, std::string(9000, 't')}, folder.path(),
            programEnvironment());
    if (result.out.empty()) GTEST_SKIP() << "no small disk can be mounted here: " << result.err;
    EXPECT_EQ(result.out, "1\n1\n1\na.flac\nin.flac\nin.wav\n");
    size_t at = 0;
    for (const char* part :
         {"tonewright: full/a.flac: ", "No space left on device\n",
          "tonewright: locked/in.flac: ", "denied\n", "tonewright: locked/in.wav: ", "denied\n"}) {
        at = result.err.find(part, at);
        EXPECT_NE(at, std::string::npos) << part << " in " << result.err;
    }
}
