#include "filetag/TagTransfer.h"
#include "filetag/rifftag/RIFFTag.h"
#include "support/Files.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gmock/gmock.h>

#include <filesystem>

using namespace peru;
using filetag::rifftag::CRIFFTag;
using tests::text;
using tests::toURI;

namespace {

std::string word(uint32_t value) {
    return {reinterpret_cast<const char*>(&value), sizeof value};
}

// The size is that of the body or a wrong one. Pad bytes are spelled out by the tests.
std::string chunk(const std::string& id, const std::string& body) {
    return id + word(static_cast<uint32_t>(body.size())) + body;
}
std::string chunk(const std::string& id, uint32_t size, const std::string& body) {
    return id + word(size) + body;
}

std::string wave(const std::string& chunks) {
    return "RIFF" + word(static_cast<uint32_t>(4 + chunks.size())) + "WAVE" + chunks;
}

// A file whose writer never got to fill in the RIFF size.
std::string untold(const std::string& chunks) {
    return "RIFF" + word(0) + "WAVE" + chunks;
}

const std::string kZero(1, '\0');
const std::string kFormat =
    chunk("fmt ", std::string("\1\0\1\0\x40\x1F\0\0\x40\x1F\0\0\1\0\x8\0", 16)); // 8 kHz, mono, 8 bits
const std::string kData = chunk("data", "samples!");
const std::string kTitled = "INFO" + chunk("INAM", "Old" + kZero);

P<CRIFFTag> openTag(const std::filesystem::path& file) {
    const P<CRIFFTag> tag = make<CRIFFTag>(toURI(file));
    tag->open();
    return tag;
}

} // namespace

TEST(RiffTag, FieldsStandInTheListByteForByte) {
    const tests::CTempFolder folder;
    const auto file = folder.write("a.wav", wave(kFormat + kData));
    P<CRIFFTag> tag = openTag(file);
    EXPECT_EQ(text(tag->getTitle()) + text(tag->getTagType()), "");
    tag->setTitle("Odd name");
    tag->setArtist("Somebody");
    tag->setTrackNumber("3/12");
    tag->setYear("1999");
    tag->setGenre("Jazz");
    tag->setComment("");
    tag->setAlbum("nowhere");
    tag->setAlbumArtist("nowhere");
    tag->setArtist("Me");                       // shorter, with entries behind it
    tag->setTitle("A longer name than it was"); // longer
    tag->store();

    const std::string list = chunk("LIST", "INFO" + chunk("INAM", "A longer name than it was" + kZero) +
                                               chunk("IART", "Me" + kZero) + chunk("TRCK", "3/12" + kZero) +
                                               chunk("ICRD", "1999" + kZero) + chunk("IGNR", "Jazz" + kZero) +
                                               chunk("ICMT", kZero));
    EXPECT_EQ(tests::readFile(file), wave(kFormat + kData + list));
    tag = openTag(file);
    EXPECT_EQ(text(tag->getTagType()), "INFO");
    const std::string half(32 * 1024 * 1024, 'x');
    tag->setArtist(CString::fromUTF8(half));
    EXPECT_THAT(tests::errorOf([&] { tag->setComment(CString::fromUTF8(half)); }),
                testing::HasSubstr("64 MB"));
    EXPECT_EQ(text(tag->getComment()), "");
    tag->open();
    const std::vector<std::string> fields = {text(tag->getTitle()),       text(tag->getArtist()),
                                             text(tag->getTrackNumber()), text(tag->getYear()),
                                             text(tag->getGenre()),       text(tag->getComment()),
                                             text(tag->getAlbum()),       text(tag->getAlbumArtist())};
    EXPECT_THAT(fields,
                testing::ElementsAre("A longer name than it was", "Me", "3/12", "1999", "Jazz", "", "", ""));
}

TEST(RiffTag, StoringMovesTheListToTheEndAndKeepsTheRest) {
    const std::string artist = chunk("IART", "Me" + kZero);
    const std::string added = chunk("LIST", "INFO" + artist);
    const std::string joined = chunk("LIST", kTitled + artist);
    const std::string list = chunk("LIST", kTitled);
    const std::string other = chunk("LIST", "adtl" + chunk("labl", "mark"));
    const std::string oldTag = "TAG" + std::string(125, 'o');
    const std::string secondInfo = chunk("LIST", "INFO" + chunk("INAM", "Second" + kZero));
    const struct {
        const char* name;
        std::string before;
        std::string after; // chunks, once the artist is set
        const char* title; // read
    } cases[] = {
        {"no list", kFormat + kData, kFormat + kData + added, ""},
        {"list before the sound", kFormat + list + kData, kFormat + kData + joined, "Old"},
        {"other list", other + kFormat + kData, other + kFormat + kData + added, ""},
        {"two lists", list + kFormat + secondInfo + kData, kFormat + kData + joined, "Old"},
        {"list without entries", chunk("LIST", "INFO") + kData, chunk("LIST", "INFO") + kData + added, ""},
        {"padded sound", chunk("data", "odd") + kZero + list, chunk("data", "odd") + kZero + joined, "Old"},
        {"padded with something", chunk("data", "odd") + "\xEE" + list, chunk("data", "odd") + kZero + joined,
         "Old"},
        {"sound without a pad byte", chunk("data", "odd") + list, chunk("data", "odd") + kZero + joined,
         "Old"},
        {"unpadded at the end", chunk("data", "odd"), chunk("data", "odd") + kZero + added, ""},
        {"any pad byte at the end", chunk("data", "odd") + "x", chunk("data", "odd") + kZero + added, ""},
        {"sound longer than the file", kFormat + chunk("data", 5000, "samples!"), kFormat + kData + added,
         ""},
        {"sound of unknown length", kFormat + chunk("data", 0xFFFFFFFF, "samples!"), kFormat + kData + added,
         ""},
        {"length never told", untold(kFormat) + chunk("data", 0, "\xA0\xA1\xA2\xA3samples!"),
         kFormat + chunk("data", "\xA0\xA1\xA2\xA3samples!") + added, ""},
        {"no sound at all", kFormat + chunk("data", "") + list, kFormat + chunk("data", "") + joined, "Old"},
        {"half a chunk header at the end", kFormat + kData + "LIST\4", kFormat + kData + added, ""},
        {"list longer than the file", kData + chunk("LIST", 0xFFFFFFF0, kTitled), kData + joined, "Old"},
        {"list cut in its type", kData + chunk("LIST", 100, "INF"),
         kData + chunk("LIST", "INF") + kZero + added, ""},
        {"nothing but a header", "", added, ""},
        {"ID3v1 tag behind the chunks", wave(kFormat + kData) + oldTag,
         wave(kFormat + kData + added) + oldTag, ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const tests::CTempFolder folder;
        const auto file = folder.write("a.wav", c.before.starts_with("RIFF") ? c.before : wave(c.before));
        P<CRIFFTag> tag = openTag(file);
        EXPECT_EQ(text(tag->getTitle()), c.title);
        tag->setArtist("Me");
        tag->store();
        EXPECT_EQ(tests::readFile(file), c.after.starts_with("RIFF") ? c.after : wave(c.after));
        tag = openTag(file);
        EXPECT_EQ(text(tag->getArtist()), "Me");
        EXPECT_EQ(text(tag->getTitle()), c.title);
    }
}

// Every value must be readable before another field is set, and together with it afterwards.
TEST(RiffTag, ListsOfOtherProgramsAreReadAndExtended) {
    const std::string artist = chunk("IART", "Them" + kZero);
    const struct {
        const char* name;
        std::string entries;
        const char* title;
        const char* artist;
    } cases[] = {
        {"odd and unpadded", chunk("INAM", "ab" + kZero) + artist, "ab", "Them"},
        {"odd and padded", chunk("INAM", "ab" + kZero) + kZero + artist, "ab", "Them"},
        {"padded at the end", artist + chunk("INAM", "ab" + kZero) + kZero, "ab", "Them"},
        {"unterminated", chunk("INAM", "abcd") + artist, "abcd", "Them"},
        {"padded twice", chunk("INAM", "ab" + kZero) + kZero + kZero + artist, "ab", "Them"},
        {"filled up with zeros", chunk("INAM", "ab" + std::string(8, '\0')) + artist, "ab", "Them"},
        {"longer than the list", artist + chunk("INAM", 0xFFFFFFFF, "abc"), "abc", "Them"},
        {"twice", chunk("INAM", "ab") + chunk("INAM", "cd") + artist, "ab", "Them"},
        {"rubbish behind the last", chunk("INAM", "ab") + artist + "rubbish", "ab", "Them"},
        {"code page", chunk("INAM", "caf\xE9 \x80") + artist, "café €", "Them"},
        {"no whole entry", "INAM", "", ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const tests::CTempFolder folder;
        const auto file = folder.write("a.wav", wave(kData + chunk("LIST", "INFO" + c.entries)));
        P<CRIFFTag> tag = openTag(file);
        EXPECT_EQ(text(tag->getTitle()), c.title);
        EXPECT_EQ(text(tag->getArtist()), c.artist);
        tag->setYear("2001");
        tag->store();
        tag = openTag(file);
        EXPECT_EQ(text(tag->getTitle()), c.title);
        EXPECT_EQ(text(tag->getArtist()), c.artist);
        EXPECT_EQ(text(tag->getYear()), "2001");
        tag->setTitle("Another title");
        EXPECT_EQ(text(tag->getArtist()), c.artist);
        EXPECT_EQ(text(tag->getYear()), "2001");
    }
}

TEST(RiffTag, WithoutChangesTheFileIsNotTouched) {
    const tests::CTempFolder folder;
    const auto file = folder.write("a.wav", wave(kData + "rest"));
    const auto time = std::filesystem::last_write_time(file);
    const P<CRIFFTag> tag = openTag(file);
    std::filesystem::permissions(file, std::filesystem::perms::owner_read);
    tag->store();
    tag->setTitle("dropped");
    tag->close();
    tag->setTitle("closed");
    tag->store();
    EXPECT_EQ(std::filesystem::last_write_time(file), time);
    EXPECT_EQ(tests::readFile(file), wave(kData + "rest"));
}

TEST(RiffTag, WhatIsNoWaveFileIsRefusedByName) {
    const std::string good = wave(kFormat + kData);
    const struct {
        const char* name;
        std::string bytes;
    } cases[] = {{"empty", ""},
                 {"cut header", good.substr(0, 11)},
                 {"rf64", "RF64" + good.substr(4)},
                 {"rifx", "RIFX" + good.substr(4)},
                 {"other riff", good.substr(0, 8) + "AVI " + good.substr(12)}};
    const tests::CTempFolder folder;
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const auto file = folder.write("bad name.wav", c.bytes);
        const P<CRIFFTag> tag = make<CRIFFTag>(toURI(file));
        EXPECT_THROW(tag->open(), CFileFormatNotSupportedError);
        EXPECT_THAT(tests::errorOf([&] { tag->open(); }), testing::HasSubstr("bad%20name.wav"));
        EXPECT_FALSE(tag->isOpened());

        // The file may have been replaced since it was opened.
        folder.write("bad name.wav", good);
        tag->open();
        tag->setTitle("Title");
        folder.write("bad name.wav", c.bytes);
        EXPECT_THROW(tag->store(), CFileFormatNotSupportedError);
        EXPECT_EQ(tests::readFile(file), c.bytes);
    }
    const auto file = folder.write("b.wav", good);
    const P<CRIFFTag> one = openTag(file);
    const P<CRIFFTag> other = openTag(file);
    one->setTitle("one");
    one->store();
    other->setArtist("other");
    other->store();
    one->setComment("one");
    one->store();
    for (const P<CRIFFTag>& tag : {one, openTag(file)})
        EXPECT_EQ(text(tag->getTitle()) + text(tag->getArtist()) + text(tag->getComment()), "oneotherone");
    ASSERT_EQ(tests::run({"mkfifo", folder / "pipe.wav"}).exitCode, 0);
    EXPECT_THROW(openTag(folder / "pipe.wav"), CFileError);
    EXPECT_THROW(openTag(folder / "missing.wav"), CFileNotFoundError);
    EXPECT_THROW(openTag(folder.path()), CFileError);
}

// Most programs prefer the ID3v2 chunk where a file has both.
TEST(RiffTag, TextsInAnID3v2ChunkFollow) {
    const tests::CTempFolder folder;
    const auto file = folder.write("a.wav", wave(kFormat + chunk("id3 ", "no tag") + kData));
    const auto mutagen = [&](const std::string& code) {
        return tests::run(
            {"/usr/bin/python3", "-c",
             "import sys, mutagen.wave as w, mutagen.id3 as i\nf = w.WAVE(sys.argv[1])\n" + code, file});
    };
    openTag(file)->store();
    P<CRIFFTag> tag = openTag(file);
    tag->setTitle("kept");
    tag->store();
    EXPECT_NE(tests::readFile(file).find(chunk("id3 ", "no tag")), std::string::npos) << "left alone";
    folder.write("a.wav", wave(kFormat + kData));
    const tests::SProcessResult made =
        mutagen("f.add_tags()\n"
                "for x in [i.TIT2(text='Old'), i.TPE1(text='Stays'), i.TALB(text='Album'), "
                "i.TCON(text='Jazz'), i.COMM(desc='', text='c'),\n"
                "  i.APIC(mime='image/png', data=b'p' * 5001), i.PRIV(owner='o', data=b'd')]: "
                "f.tags.add(x)\nf.save()");
    ASSERT_EQ(made.exitCode, 0) << made.err;
    tag = openTag(file);
    tag->setTitle(CString::fromUTF8("New \xc3\xbc"));
    tag->setGenre("");
    tag->setYear("1999");
    tag->setComment("d");
    tag->store();
    EXPECT_EQ(mutagen("print(sorted(f.tags), f.tags['TIT2'], f.tags['TPE1'], f.tags['TDRC'], "
                      "f.tags['COMM::XXX'], len(f.tags['APIC:'].data))")
                  .out,
              "['APIC:', 'COMM::XXX', 'PRIV:o:d', 'TALB', 'TDRC', 'TIT2', 'TPE1'] New \xc3\xbc Stays 1999 d "
              "5001\n");
    EXPECT_EQ(text(openTag(file)->getTitle()), "New \xc3\xbc");
    const std::string bytes = tests::readFile(file);
    EXPECT_EQ(bytes.substr(4, 4), word(static_cast<uint32_t>(bytes.size() - 8)));
    tag->setTitle(CString::fromUTF8("New \xc3\xbc"));
    tag->setComment("d");
    tag->store();
    EXPECT_TRUE(tests::readFile(file) == bytes) << "texts that the chunk has do not change it";
}

// Sparse files: first the list follows 3 GB of data, then there is no room for it below 4 GB.
TEST(RiffTag, LargeFilesAreReadUpToTheLimitOfTheFormat) {
    const tests::CTempFolder folder;
    const auto grow = [&](const char* name, uint32_t dataSize, const std::string& tail) {
        const auto file = folder.write(name, wave(chunk("data", dataSize, "")));
        std::filesystem::resize_file(file, 20 + uint64_t{dataSize});
        std::ofstream(file, std::ios::binary | std::ios::app) << tail;
        return file;
    };
    const auto large = grow("large.wav", 3'000'000'000, chunk("LIST", kTitled));
    EXPECT_EQ(text(openTag(large)->getTitle()), "Old");

    const auto full = grow("full.wav", 0xFFFFFFFF - 50, "");
    const P<CRIFFTag> tag = openTag(full);
    tag->setTitle("This text has no place in the file");
    EXPECT_THAT(tests::errorOf([&] { tag->store(); }),
                testing::AllOf(testing::HasSubstr("full.wav"), testing::HasSubstr("4 GB")));
    EXPECT_EQ(std::filesystem::file_size(full), 20 + uint64_t{0xFFFFFFFF - 50});

    const auto list = grow("list.wav", 100'000'000, "");
    { // turn the hole into the list
        std::fstream file(list, std::ios::binary | std::ios::in | std::ios::out);
        file.seekp(12) << "LIST" << word(100'000'000) << "INFO";
    }
    EXPECT_THAT(tests::errorOf([&] { openTag(list); }), testing::HasSubstr("list.wav"));
}

// Readers stop at the first odd entry without a pad byte.
TEST(RiffTag, OddEntriesAreLastOrPadded) {
    const tests::CTempFolder folder;
    const auto file = folder.write("a.wav", wave(kFormat + kData));
    const auto storeAndRead = [&](const char* padding) {
        ::setenv("TONEWRIGHT_PAD_INFO", padding, 1);
        const P<CRIFFTag> tag = openTag(file);
        tag->setArtist("ab");
        tag->setComment("abcd");
        tag->setTitle("even");
        tag->setGenre("xyz"); // even with its terminating zero, the others are odd
        tag->store();
        ::unsetenv("TONEWRIGHT_PAD_INFO");
        EXPECT_EQ(text(openTag(file)->getComment()), "abcd");
        std::string seen =
            tests::run({"exiftool", "-s3", "-Genre", "-Artist", "-Comment", "-Title", file}).out;
        for (const filetag::STagField& field : filetag::readAllTags(toURI(file)).fields)
            seen += text(field.key) + " ";
        return seen;
    };
    EXPECT_THAT(storeAndRead(""), testing::HasSubstr("GENRE"));
    const std::string all = "xyz\nab\nabcd\neven\nARTIST COMMENT GENRE TITLE ";
    EXPECT_EQ(storeAndRead("1"), all);
    EXPECT_EQ(storeAndRead(""), all) << "pad bytes that are there stay";
}

TEST(RiffTag, OtherProgramsReadTextsAndSound) {
    const struct {
        const char* bits; // for 2001 samples: an odd number of bytes, so a pad byte follows
        const char16_t* title;
    } cases[] = {{"8", u"plain"}, {"24", u"Füße"}, {"8", u"Привет, мир"}, {"24", u"日本語のタイトル"},
                 {"8", u"क ख ग"}, {"24", u"🎵 𝄞 🎷"}};
    for (const auto& c : cases) {
        const std::string title = text(CString::fromUTF16(c.title));
        SCOPED_TRACE(title);
        const tests::CTempFolder folder;
        const auto file = folder / "a.wav";
        ASSERT_EQ(tests::run({"sox", "-n", "-r", "8000", "-c", "1", "-b", c.bits, file, "synth", "2001s",
                              "sine", "440"})
                      .exitCode,
                  0);
        const auto hear = [&file] {
            const auto sox = tests::run({"sox", file, "-t", "raw", "-"});
            const auto ffmpeg = tests::run({"ffmpeg", "-v", "error", "-i", file, "-f", "s24le", "-"});
            EXPECT_EQ(sox.exitCode + ffmpeg.exitCode, 0) << sox.err << ffmpeg.err;
            return std::pair(sox.out, ffmpeg.out);
        };
        const auto before = hear();
        const P<CRIFFTag> tag = openTag(file);
        tag->setTitle(c.title);
        tag->setArtist("Artist");
        tag->store();
        EXPECT_EQ(CString::toStdU16String(openTag(file)->getTitle()), c.title);
        EXPECT_TRUE(hear() == before);
        const auto seen = tests::run({"ffprobe", "-v", "error", "-show_entries", "format_tags=title,artist",
                                      "-of", "default=nk=1:nw=1", file});
        EXPECT_EQ(seen.out, title + "\nArtist\n") << seen.err;
    }
}
