// Tests for all formats handled by TagLib, checked with other programs.
#include "Support.h"
#include "filetag/TagTransfer.h"

#include <functional>

using namespace peru;
using filetag::CFileTagFactory;
using filetag::ICoverArt;
using filetag::ICoverArtFileTag;
using filetag::IFileTag;
using tests::CTempFolder;
using tests::CTexts;
using tests::kFields;
using tests::open;
using tests::toURI;

namespace {

std::string repeat(const std::string& text, int count) {
    std::string result;
    while (count-- > 0) result += text;
    return result;
}

const std::string kTexts[] = {
    "Plain text",
    "Caf\u00e9 \u00fcber \u00a9",
    "\u041f\u0440\u0438\u0432\u0435\u0442, \u043c\u0438\u0440",
    "\u65e5\u672c\u8a9e\u306e\u66f2\u540d",
    "\U0001f3b5 and \U0001f1e9\U0001f1ea",
    "e\u0301a\u0308 \u0915\u094d\u0937",
    "line 1\nline 2",
    repeat("ten ch\u00e4rs.", 1000),
};
constexpr size_t kTextCount = std::size(kTexts);

// In the order of the fields.
constexpr const char* kNamesOfFFmpeg[] = {"title", "artist", "album", "album_artist",
                                          "track", "date",   "genre", "comment"};

// The other programs reformat years, track numbers and genres.
std::string getText(size_t field, size_t round) {
    if (std::string(kFields[field].name) == "year") return std::to_string(1990 + round);
    if (std::string(kFields[field].name) == "trackNumber") return std::to_string(round + 1) + "/12";
    const std::string& text = kTexts[(field + round) % kTextCount];
    return std::string(kFields[field].name) == "genre" && text.starts_with("line") ? "One line" : text;
}

CTexts makeTexts(size_t round) {
    CTexts texts;
    for (size_t field = 0; field < std::size(kFields); ++field)
        texts[kFields[field].name] = getText(field, round);
    return texts;
}

void store(const std::filesystem::path& file, const CTexts& texts) {
    const P<IFileTag> tag = open(file);
    for (const tests::SField& field : kFields) {
        const auto found = texts.find(field.name);
        if (found != texts.end()) (tag.get()->*field.set)(tests::fromStandard(found->second));
    }
    tag->store();
}

// Each file has the texts of the round after its own.
void expectNextTexts(const std::vector<std::string>& files) {
    std::vector<std::string> command{"fields"};
    command.insert(command.end(), files.begin(), files.end());
    const auto found = tests::judge(command).get<std::vector<CTexts>>();
    ASSERT_EQ(found.size(), kTextCount);
    for (size_t round = 0; round < kTextCount; ++round) EXPECT_EQ(found[round], makeTexts(round + 1));
}

P<CMemoryBlock> makeBlock(const std::string& bytes) {
    const P<CMemoryBlock> block = make<CMemoryBlock>(static_cast<int64_t>(bytes.size()));
    std::copy(bytes.begin(), bytes.end(), block->getData());
    return block;
}

std::string toString(const P<ICoverArt>& picture) {
    if (!picture) return "none";
    const P<CMemoryBlock> data = picture->getData();
    return std::to_string(picture->getPictureType()) + " " + tests::text(picture->getMimeType()) + " " +
           std::string(reinterpret_cast<const char*>(data->getData()), static_cast<size_t>(data->getSize()));
}

class FileTag : public testing::TestWithParam<const char*> {
protected:
    FileTag() : m_file(tests::makeSound(m_folder, GetParam())) {}

    CTempFolder m_folder;
    std::filesystem::path m_file;
};

} // namespace

TEST_P(FileTag, OthersReadWhatIsWritten) {
    const std::string sound = tests::hashSound(m_file);
    ASSERT_NE(sound, "");
    std::vector<std::string> files;
    for (size_t round = 0; round < kTextCount; ++round) {
        const std::filesystem::path copy = m_folder / ("round" + std::to_string(round) + "." + GetParam());
        std::filesystem::copy_file(m_file, copy);
        EXPECT_EQ(tests::readFields(*open(copy))["title"], "");
        store(copy, makeTexts(round));
        EXPECT_EQ(tests::readFields(*open(copy)), makeTexts(round));
        // Overwrite with shorter and longer texts.
        store(copy, makeTexts(round + 1));
        files.push_back(copy);
    }
    EXPECT_EQ(tests::hashSound(files.back()), sound) << "with the longest way through tags of all lengths";
    expectNextTexts(files);

    CTexts empty;
    for (const tests::SField& field : kFields) empty[field.name] = "";
    store(files.back(), empty);
    EXPECT_EQ(tests::readFields(*open(files.back())), empty);
    EXPECT_EQ(tests::judge({"fields", files.back()})[0].get<CTexts>(), empty);
    EXPECT_EQ(tests::hashSound(files.back()), sound);
}

TEST_P(FileTag, ReadsWhatOthersWrite) {
    std::vector<std::string> files;
    for (size_t round = 0; round < kTextCount; ++round) {
        tests::judge({"set", m_file, nlohmann::json(makeTexts(round)).dump()});
        EXPECT_EQ(tests::readFields(*open(m_file)), makeTexts(round));

        const std::filesystem::path other = m_folder / ("ffmpeg" + std::to_string(round) + "." + GetParam());
        std::vector<std::string> command{"ffmpeg", "-v",   "error",         "-i", m_file,
                                         "-c",     "copy", "-map_metadata", "-1"};
        for (size_t i = 0; i < std::size(kFields); ++i)
            command.insert(command.end(), {"-metadata", kNamesOfFFmpeg[i] + ("=" + getText(i, round))});
        command.push_back(other);
        tests::run(command);
        EXPECT_EQ(tests::readFields(*open(other)), makeTexts(round));
        store(other, makeTexts(round + 1));
        files.push_back(other);
    }
    expectNextTexts(files);
}

TEST_P(FileTag, ReadsTheFirstOfSeveralValuesAndWritesOne) {
    CTexts first;
    CTexts fresh;
    nlohmann::json several;
    for (const tests::SField& field : kFields) {
        const std::string name = field.name;
        if (name == "comment" && GetParam() == std::string("mp3")) continue; // has one value only
        const bool number = name == "year" || name == "trackNumber";
        first[name] = number ? "1991" : "first " + name;
        fresh[name] = number ? "1993" : "new " + name;
        several[name] = {first[name], number ? "1992" : "second " + name, number ? "1990" : "third " + name};
    }
    tests::judge({"set", m_file, several.dump()});
    CTexts read = tests::readFields(*open(m_file));
    if (!first.contains("comment")) read.erase("comment");
    EXPECT_EQ(read, first);
    // A store of one field does not reorder the others.
    for (const char* title : {"a", "longer than before"}) store(m_file, {{"title", title}});
    several["title"] = "longer than before";
    nlohmann::json found = tests::judge({"fields", m_file})[0];
    found.erase("comment");
    several.erase("comment");
    EXPECT_EQ(found, several);
    store(m_file, fresh);
    fresh.emplace("comment", "");
    EXPECT_EQ(tests::judge({"fields", m_file})[0], nlohmann::json(fresh));
}

// Broken by other programs, and kept as they are.
TEST(XiphTag, KeepsPicturesThatItCannotRead) {
    const CTempFolder folder;
    for (const char* extension : {"flac", "ogg"}) {
        const auto file = tests::makeSound(folder, extension);
        tests::judge({"broken", file});
        // Other programs refuse to read such a FLAC file.
        const auto read = [&]() -> std::string {
            if (file.extension() == ".ogg") return tests::judge({"others", file}).dump();
            const std::string bytes = tests::readFile(file);
            const size_t found = bytes.find(std::string("\x0e\0\0\0\3\0\0\xff\xff", 9) + "broken");
            return found == std::string::npos ? "" : bytes.substr(found - 3, 4);
        };
        const std::string before = read();
        ASSERT_NE(before, "");
        const P<ICoverArtFileTag> tag(open(file));
        EXPECT_EQ(tag->getCoverArtCount(), 0);
        tag->setTitle("new");
        tag->store();
        EXPECT_EQ(read(), before) << extension;
        filetag::setTagField(toURI(file), "TITLE", {newString("newer")});
        EXPECT_EQ(read(), before) << extension;
    }
}

TEST_P(FileTag, KeepsWhatItDoesNotKnow) {
    tests::judge({"extras", m_file});
    if (GetParam() == std::string("flac")) {
        const auto sheet = m_folder.write(
            "sheet",
            "FILE \"a\" WAVE\nTRACK 01 AUDIO\nINDEX 01 00:00:00\nTRACK 02 AUDIO\nINDEX 01 00:00:30\n");
        ASSERT_EQ(tests::run({"metaflac", "--import-cuesheet-from=" + sheet.string(), m_file}).exitCode, 0);
    }
    const nlohmann::json before = tests::judge({"others", m_file});
    ASSERT_GE(before.size(), 3u);
    store(m_file, {{"title", repeat("new ", 3000)}});
    EXPECT_EQ(tests::judge({"others", m_file}), before);
    EXPECT_EQ(tests::judge({"fields", m_file})[0]["title"], repeat("new ", 3000));
    store(m_file, {{"title", ""}, {"comment", ""}});
    EXPECT_EQ(tests::judge({"others", m_file}), before);
}

TEST_P(FileTag, HoldsPictures) {
    const std::string sound = tests::hashSound(m_file);
    const P<ICoverArtFileTag> tag(open(m_file));
    EXPECT_EQ(tag->getCoverArtCount(), 0);
    tag->addCoverArt(makeBlock("front"), "image/png", filetag::kFrontCover);
    tag->addCoverArt(makeBlock("gone"), "image/png", filetag::kBackCover);
    tag->addCoverArt(makeBlock(std::string("b\0ck", 4) + std::string(200000, 'x')), "image/jpeg",
                     filetag::kBackCover);
    const P<ICoverArt> gone = tag->getCoverArt(1);
    tag->removeCoverArt(1);
    tag->removeCoverArt(2);
    tag->removeCoverArt(-1);
    gone->setMimeType("image/gone");
    EXPECT_EQ(toString(gone), "2  ") << "reads as empty";
    for (int round = 0; round < 3; ++round) { // the memory of a removed picture must not become another one
        tag->addCoverArt(makeBlock("more"), "image/png", filetag::kFrontCover);
        EXPECT_EQ(toString(gone), "2  ");
        tag->removeCoverArt(2);
    }
    tag->store();

    const P<ICoverArtFileTag> read(open(m_file));
    ASSERT_EQ(read->getCoverArtCount(), 2);
    EXPECT_EQ(toString(read->getCoverArt(0)), "0 image/png front");
    EXPECT_EQ(toString(read->getCoverArt(1)),
              "1 image/jpeg " + std::string("b\0ck", 4) + std::string(200000, 'x'));
    EXPECT_EQ(read->getCoverArt(2), nullptr);
    EXPECT_EQ(read->getCoverArt(-1), nullptr);
    read->getCoverArt(0)->setPictureType(filetag::kConductor);
    read->replaceCoverArt(1, makeBlock("new"), "image/gif", filetag::kFileIcon);
    read->replaceCoverArt(2, makeBlock("nowhere"), "image/gif", filetag::kFileIcon);
    const P<ICoverArt> held = read->getCoverArt(0);
    read->store();
    read->close();
    EXPECT_EQ(held->getData()->getSize(), 0) << "read from a tag that is closed";

    const P<ICoverArtFileTag> again(open(m_file));
    ASSERT_EQ(again->getCoverArtCount(), 2);
    EXPECT_EQ(toString(again->getCoverArt(0)), "9 image/png front");
    EXPECT_EQ(toString(again->getCoverArt(1)), "3 image/gif new");
    EXPECT_EQ(tests::hashSound(m_file), sound);
    // The numbers in the file, according to another reader.
    const auto readTypes = [&] {
        return tests::run({"exiftool", "-a", "-n", "-PictureType", "-s3", m_file}).out;
    };
    EXPECT_EQ(readTypes(), "9\n1\n");
    for (const int index : {1, 0}) again->removeCoverArt(index);
    again->store();
    EXPECT_EQ(readTypes(), "");
    EXPECT_EQ(again->getCoverArtCount(), 0);
    again->close();
    again->addCoverArt(makeBlock("late"), "image/png", filetag::kFrontCover);
    again->removeCoverArt(0);
    EXPECT_EQ(again->getCoverArtCount(), 0);
    EXPECT_EQ(again->getCoverArt(0), nullptr);
}

TEST_P(FileTag, MapsAllPictureTypesAndReadsOtherNames) {
    // By the number in the file.
    const std::vector<int> types{2, 3, 4, 0, 1, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16, 2, 2, 2, 2};
    tests::judge({"pictures", m_file});
    const P<ICoverArtFileTag> tag(open(m_file));
    EXPECT_EQ(tests::text(tag->getYear()), "1999");
    EXPECT_EQ(tests::text(tag->getTrackNumber()), GetParam() == std::string("mp3") ? "" : "7");
    EXPECT_EQ(tests::text(tag->getGenre()), GetParam() == std::string("wma") ? "1099511627776" : "");
    ASSERT_EQ(tag->getCoverArtCount(), static_cast<int32_t>(types.size()));
    for (int i = 0; i < tag->getCoverArtCount(); ++i) {
        const P<ICoverArt> picture = tag->getCoverArt(i);
        const int number = std::stoi(tests::text(picture->getDescription()));
        EXPECT_EQ(picture->getPictureType(), types[static_cast<size_t>(number)]) << number;
        picture->setPictureType(static_cast<filetag::EPictureType>(i));
    }
    tag->store();
    EXPECT_EQ(tests::judge({"types", m_file}).get<std::vector<int>>(),
              (std::vector<int>{3, 4, 0, 1, 2, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16, 0, 0, 0, 0}));
}

TEST_P(FileTag, RefusesWhatTheFormatCannotHold) {
    const std::string kind = GetParam();
    if (kind != "flac" && kind != "wma") return; // the others have no such limit within reason
    const std::string before = tests::readFile(m_file);
    const std::string large(kind == "flac" ? 0x1000000 : 33000, 'x');
    const auto fail = [&](const std::function<void(ICoverArtFileTag&)>& change) {
        const P<ICoverArtFileTag> tag(open(m_file));
        change(*tag);
        EXPECT_NE(tests::errorOf([&] { tag->store(); }).find("too long"), std::string::npos);
        EXPECT_TRUE(tests::readFile(m_file) == before);
    };
    for (const auto set : {&IFileTag::setTitle, &IFileTag::setArtist, &IFileTag::setComment})
        fail([&](ICoverArtFileTag& tag) { (tag.*set)(tests::fromStandard(large)); });
    if (kind == "flac")
        fail([&](ICoverArtFileTag& tag) { tag.addCoverArt(makeBlock(large), "image/png", filetag::kMedia); });
}

TEST_P(FileTag, StoresOnceAndOnlyChanges) {
    const std::map<std::string, const char*> kTypes{
        {"mp3", "ID3v2.4"}, {"flac", "Vorbis comment"}, {"ogg", "Vorbis comment"}, {"wma", "ASF"}};
    tests::judge({"set", m_file, R"({"title":"old"})"});
    const std::string before = tests::readFile(m_file);
    const P<IFileTag> tag = open(m_file);
    tag->setTitle("dropped");
    tag->open();
    EXPECT_EQ(tests::text(tag->getTitle()), "old");
    tag->store();
    EXPECT_TRUE(tests::readFile(m_file) == before);
    EXPECT_THROW(tag->store(), CFileError);
    tag->open();
    tag->setTitle("new");
    tag->store();
    EXPECT_EQ(tests::text(tag->getTitle()), "new") << "readable until it is closed";
    EXPECT_EQ(tests::text(tag->getTagType()), kTypes.at(GetParam()));
    EXPECT_EQ(tests::text(open(m_file)->getTitle()), "new");
    tag->close();
    EXPECT_EQ(tests::text(tag->getTitle()) + tests::text(tag->getTagType()), "");
    tag->setTitle("nowhere");
    EXPECT_THROW(tag->store(), CFileError);
}

TEST_P(FileTag, SetsItsTextsInWhatAnotherProgramWrote) {
    const std::string old = tests::readFile(m_file);
    const std::string text = repeat("new ", 3000);
    for (const std::string& other : {old + "more", std::string(old).replace(old.size() / 2, 4, "else")}) {
        m_folder.write(m_file.filename(), other);
        const auto time = std::filesystem::last_write_time(m_file);
        store(m_file, {{"title", text}});
        const std::string expected = tests::readFile(m_file);
        for (const bool picture : {false, true}) {
            m_folder.write(m_file.filename(), old);
            std::filesystem::last_write_time(m_file, time);
            const P<ICoverArtFileTag> tag(open(m_file));
            tag->setTitle(tests::fromStandard(text));
            if (picture) tag->addCoverArt(makeBlock("p"), "image/png", filetag::kFrontCover);
            m_folder.write(m_file.filename(), other);
            std::filesystem::last_write_time(m_file, time);
            if (picture)
                EXPECT_NE(tests::errorOf([&] { tag->store(); }).find("was changed by another"),
                          std::string::npos);
            else
                tag->store();
            EXPECT_TRUE(tests::readFile(m_file) == (picture ? other : expected));
        }
    }
    const P<IFileTag> tag = open(m_file);
    tag->setTitle("late");
    std::filesystem::remove(m_file);
    EXPECT_THROW(tag->store(), CFileNotFoundError);
}

TEST_P(FileTag, RefusesContentOfAnotherFormat) {
    const std::string sound = tests::readFile(m_file);
    for (const std::string& content :
         {std::string(), std::string(4096, '\0'), std::string("RIFF....WAVEfmt "),
          repeat("text that is no sound ", 500)}) {
        m_folder.write(m_file.filename(), content);
        EXPECT_THROW(open(m_file), CFileFormatNotSupportedError) << content.substr(0, 30);
    }
    // A truncated file is either read or refused, and stays readable after a store.
    for (size_t size = 1; size < 6000; size = size * 3 / 2 + 1) {
        m_folder.write(m_file.filename(), sound.substr(0, size));
        try {
            const P<IFileTag> tag = open(m_file);
            tag->setTitle("cut");
            tag->store();
            EXPECT_EQ(tests::text(open(m_file)->getTitle()), "cut") << size;
        } catch (const CFileError&) {
        }
    }
    std::filesystem::remove(m_file);
    EXPECT_THROW(open(m_file), CFileNotFoundError);
    std::filesystem::create_directory(m_file);
    EXPECT_THROW(open(m_file), CFileError);
    ASSERT_EQ(tests::run({"mkfifo", m_file.string() + "." + GetParam()}).exitCode, 0);
    EXPECT_THROW(open(m_file.string() + "." + GetParam()), CFileError) << "does not wait for a writer";
}

INSTANTIATE_TEST_SUITE_P(Formats, FileTag, testing::Values("mp3", "flac", "ogg", "wma"),
                         [](const auto& instance) { return std::string(instance.param); });

// Programs read one of two names. None of them may still see the old comment.
TEST(XiphTag, CommentsOfBothNamesGo) {
    const CTempFolder folder;
    const auto file = tests::makeSound(folder, "flac");
    for (const auto& [names, written] :
         std::map<std::vector<std::string>, std::string>{{{"COMMENT"}, "COMMENT=new\n"},
                                                         {{"DESCRIPTION"}, "DESCRIPTION=new\n"},
                                                         {{"COMMENT", "DESCRIPTION"}, "DESCRIPTION=new\n"}}) {
        tests::run({"metaflac", "--remove-all-tags", file});
        for (const std::string& name : names)
            tests::run({"metaflac", "--set-tag=" + name + "=" + name, file});
        EXPECT_EQ(tests::readFields(*open(file))["comment"], names.back());
        store(file, {{"comment", "new"}});
        EXPECT_EQ(tests::run({"metaflac", "--export-tags-to=-", file}).out, written);
        store(file, {{"comment", ""}});
        EXPECT_EQ(tests::run({"metaflac", "--export-tags-to=-", file}).out, "");
    }
}

TEST(XiphTag, KeepsTextsInAFileWithoutAComment) {
    const CTempFolder folder;
    const auto file = tests::makeSound(folder, "flac");
    tests::run({"metaflac", "--remove-all", "--dont-use-padding", file});
    const CTexts texts{{"title", "a"}, {"trackNumber", "A1"}, {"year", "circa 1980"}};
    store(file, texts);
    EXPECT_EQ(tests::run({"metaflac", "--export-tags-to=-", file}).out,
              "DATE=circa 1980\nTITLE=a\nTRACKNUMBER=A1\n");
    // Texts of programs that do not write UTF-8.
    ASSERT_EQ(tests::run({"metaflac", "--set-tag=ARTIST=Cafe", file}).exitCode, 0);
    std::string bytes = tests::readFile(file);
    bytes[bytes.find("Cafe") + 3] = '\xe9';
    folder.write(file.filename(), bytes);
    store(file, {{"title", "b"}});
    EXPECT_EQ(tests::readFields(*open(file))["artist"], "Caf\u00e9");
}

TEST(FileTagFactory, GoesByTheExtension) {
    const CTempFolder folder;
    const auto flac = tests::makeSound(folder, "flac");
    const P<CFileTagFactory> factory = make<CFileTagFactory>();
    const auto find = [&](const std::string& name) {
        if (name != "sound.flac") std::filesystem::copy_file(flac, folder / name);
        const P<IFileTag> tag = factory->create(toURI(folder / name));
        return tag ? tests::text(tag->getTagType()) : "none";
    };
    EXPECT_EQ(find("A.FLAC"), "Vorbis comment");
    EXPECT_EQ(find("a.flac.tmp"), "none");
    factory->setTempExtension(newString(".tmp"));
    EXPECT_EQ(find("sound.flac"), "Vorbis comment");
    EXPECT_EQ(find("b.flac.tmp"), "Vorbis comment");
    EXPECT_EQ(find("c.flac.part"), "none");
    EXPECT_EQ(find("flac"), "none");
    EXPECT_EQ(find("tmp.tmp"), "none");
    EXPECT_THROW(find("d.wav"), CFileFormatNotSupportedError);
    EXPECT_THROW(find("e.Ogg.tmp"), CFileFormatNotSupportedError);
}
