// Special cases of MP3: two tags in one file, and three versions of ID3v2.
#include "Support.h"
#include "filetag/TagTransfer.h"

#include <algorithm>

using namespace peru;
using filetag::IFileTag;
using tests::CTempFolder;
using tests::CTexts;
using tests::open;
using tests::toURI;

namespace {

// exiftool distinguishes the two tags.
std::string readWithExiftool(const std::filesystem::path& file, const std::string& name) {
    const std::string out = tests::run({"exiftool", "-s3", "-" + name, file}).out;
    return out.substr(0, out.find('\n'));
}

} // namespace

TEST(Mp3Tag, BringsBothTagsInStep) {
    const CTempFolder folder;
    const auto file = tests::makeSound(folder, "mp3");
    const auto old = folder / "old.mp3";
    ASSERT_EQ(tests::run({"lame", "--quiet", "--decode", file, folder / "a.wav"}).exitCode, 0);
    ASSERT_EQ(tests::run({"lame", "--quiet", "--id3v1-only", "--tt", "Old title", "--ta", "Old artist",
                          "--ty", "1984", "--tn", "7", "--tg", "Jazz", folder / "a.wav", old})
                  .exitCode,
              0);
    P<IFileTag> tag = open(old);
    EXPECT_EQ(tests::text(tag->getTagType()), "ID3v1");
    EXPECT_EQ(tests::text(tag->getTitle()), "Old title");
    tag->setAlbum("New album");
    tag->setTitle("");
    tag->store();
    const CTexts wanted{{"title", ""},       {"artist", "Old artist"}, {"album", "New album"},
                        {"albumArtist", ""}, {"trackNumber", "7"},     {"year", "1984"},
                        {"genre", "Jazz"},   {"comment", ""}};
    EXPECT_EQ(tests::judge({"fields", old})[0].get<CTexts>(), wanted);
    EXPECT_EQ(tests::readFields(*open(old)), wanted);
    EXPECT_EQ(readWithExiftool(old, "ID3v1:Album"), "New album");
    EXPECT_EQ(readWithExiftool(old, "ID3v1:Title"), "");
    EXPECT_EQ(readWithExiftool(old, "ID3v1:Artist"), "Old artist");

    tag = open(old);
    for (const tests::SField& field : tests::kFields) (tag.get()->*field.set)("");
    tag->store();
    tag->open();
    EXPECT_EQ(tests::text(tag->getTagType()), "") << "no empty tag stays";
}

// ID3v1 can only hold numbers, which must not replace the texts.
TEST(Mp3Tag, KeepsTextsThatAreNoNumbers) {
    const CTempFolder folder;
    const auto file = tests::makeSound(folder, "mp3");
    P<IFileTag> tag = open(file);
    tag->setTrackNumber("A1/B2");
    tag->setYear("unknown");
    tag->store();
    tag = open(file);
    EXPECT_EQ(tests::text(tag->getTagType()), "ID3v2.4");
    tag->setTitle("a");
    tag->store();
    tag = open(file);
    EXPECT_EQ(tests::text(tag->getTrackNumber()), "A1/B2");
    EXPECT_EQ(tests::text(tag->getYear()), "unknown");
    tag->setTrackNumber("12/13");
    tag->setYear("1999-12-31");
    tag->store();
    EXPECT_EQ(readWithExiftool(file, "ID3v1:Track"), "12");
    EXPECT_EQ(readWithExiftool(file, "ID3v1:Year"), "1999");
}

TEST(Mp3Tag, ReadsAnAPETagAndKeepsItInStep) {
    const CTempFolder folder;
    const auto file = tests::makeSound(folder, "mp3");
    tests::judge({"ape", file});
    P<IFileTag> tag = open(file);
    EXPECT_EQ(tests::text(tag->getTagType()), "APE");
    EXPECT_EQ(tests::text(tag->getTitle()), "APE title");
    EXPECT_EQ(tests::text(tag->getTrackNumber()), "7/9");
    tag->setTitle("New title");
    tag->setAlbum("Only in ID3");
    tag->store();
    const nlohmann::json items = tests::judge({"readape", file});
    EXPECT_EQ(items, (nlohmann::json{{"Artist", "APE artist"},
                                     {"TITLE", "New title"},
                                     {"Track", "7/9"},
                                     {"replaygain_track_gain", "-3 dB"}}));
    const CTexts texts = tests::judge({"fields", file})[0].get<CTexts>();
    EXPECT_EQ(texts.at("artist"), "APE artist");
    EXPECT_EQ(texts.at("title"), "New title");
}

// Whatever another program reads from a file before a store, it reads afterwards.
TEST(Mp3Tag, KeepsTheFramesOfOddTags) {
    const CTempFolder sounds;
    const CTempFolder folder;
    tests::judge({"make", tests::makeSound(sounds, "mp3"), folder.path()}, "odd_id3.py");
    std::vector<std::string> command{"frames"};
    for (const auto& entry : std::filesystem::directory_iterator(folder.path()))
        command.push_back(entry.path());
    const auto read = [&command] {
        return tests::judge(command, "odd_id3.py").get<std::vector<std::map<std::string, nlohmann::json>>>();
    };
    const auto before = read();
    ASSERT_GT(before.size(), 20u);
    for (size_t i = 0; i < before.size(); ++i) {
        SCOPED_TRACE(command[i + 1]);
        const std::string copy = command[i + 1] + ".all.mp3";
        std::filesystem::copy_file(command[i + 1], copy);
        command.push_back(copy);
        const P<IFileTag> tag = open(command[i + 1]);
        EXPECT_EQ(tests::text(tag->getArtist()), before[i].contains("TPE1") ? "Artist" : "");
        std::string date = before[i].contains("TDRC") ? before[i].at("TDRC")[0].get<std::string>() : "";
        std::replace(date.begin(), date.end(), ' ', 'T');
        EXPECT_EQ(tests::text(tag->getYear()), date);
        const std::string version = command[i + 1].substr(command[i + 1].size() - 7, 3); // "2.3.mp3"
        EXPECT_EQ(tests::text(tag->getTagType()), "ID3v" + version);
        tag->setTitle("New");
        tag->store();
        filetag::setTagField(toURI(copy), "TITLE", {newString("New")});
    }
    auto after = read();
    for (size_t i = 0; i < after.size(); ++i) {
        SCOPED_TRACE(command[i + 1]);
        EXPECT_EQ(after[i]["TIT2"][0], "New");
        for (const auto& [key, value] : before[i % before.size()]) EXPECT_EQ(after[i][key], value) << key;
    }
}

// Day and time of day have two digits for each number. What has not stays as it is.
TEST(Mp3Tag, JoinsOnlyDatesThatAreValid) {
    const CTempFolder folder;
    const std::string sound = tests::readFile(tests::makeSound(folder, "mp3"));
    const auto frame = [](const std::string& id, const std::string& text) {
        return id + std::string("\0\0\0", 3) + static_cast<char>(text.size() + 1) + std::string(3, '\0') +
               text;
    };
    for (const std::string c : {"010100001999-01-01T00:00", "311223591999-12-31T23:59", "011224001999-12-01",
                                "011200601999-12-01", "0112x1011999-12-01", "001201011999", "321201011999",
                                "310001011999", "311301011999", "11x101011999", "01010101199"}) {
        const std::string day = c.substr(0, 4), time = c.substr(4, 4), date = c.substr(8);
        const std::string frames =
            frame("TYER", date.substr(0, 4)) + frame("TDAT", day) + frame("TIME", time);
        const auto file = folder.write("a.mp3", std::string("ID3\3\0\0\0\0\0", 9) +
                                                    static_cast<char>(frames.size()) + frames + sound);
        const P<IFileTag> tag = open(file);
        EXPECT_EQ(tests::text(tag->getYear()), date) << c;
        tag->setTitle("New");
        tag->store();
        filetag::setTagField(toURI(file), "MOOD", {newString("calm")});
        EXPECT_EQ(tests::text(open(file)->getYear()), date) << c;
        std::string left;
        for (const auto& name : filetag::readAllTags(toURI(file)).others) left += tests::text(name);
        EXPECT_EQ(left, date.size() > 10 ? "" : date.size() > 4 ? "TIME" : "TDATTIME") << c;
    }
}

TEST(Mp3Tag, RefusesToLoseAFrame) {
    const CTempFolder folder;
    const std::string sound = tests::readFile(tests::makeSound(folder, "mp3"));
    const std::string encrypted("\3\0\0\0\0\0\x18"
                                "ENCR\0\0\0\6\0\x40xhello",
                                23);
    const std::string old("\2\0\0\0\0\0\x14"
                          "CRM\0\0\6hello!",
                          19);
    const std::string compressed("\2\0\x40\0\0\0\x14"
                                 "TT2\0\0\6hello!",
                                 19);
    std::string newer = encrypted;
    newer[0] = newer[16] = 4; // the version, and its flag of encrypted frames
    for (const auto& [frame, name] :
         {std::pair(encrypted, "ENCR"), {newer, "ENCR"}, {old, "CRM"}, {compressed, "ID3v2.2"}}) {
        const std::string content = "ID3" + frame + std::string(8, '\0') + sound;
        const auto file = folder.write("a.mp3", content);
        const P<IFileTag> tag = open(file);
        tag->setTitle("New");
        const std::string error = tests::errorOf([&] { tag->store(); });
        EXPECT_NE(error.find(name), std::string::npos) << error;
        const std::string other =
            tests::errorOf([&] { filetag::setTagField(toURI(file), "TITLE", {newString("New")}); });
        EXPECT_EQ(other, error);
        EXPECT_TRUE(tests::readFile(file) == content);
    }
}
