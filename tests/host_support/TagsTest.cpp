// The functions for whole tags; their effect on files of every format is tested with the program.
#include "HostSupport.h"

using namespace tests;

namespace {

class HostTags : public CHostTest {
protected:
    std::u16string make(const char* name) {
        EXPECT_EQ(run({"sox", "-n", "-r", "44100", "-c", "2", folder / name, "synth", "0.1", "sine", "300"})
                      .exitCode,
                  0);
        return uriOf(folder / name);
    }
    std::string makePicture(const std::vector<std::string>& kind, const char* name) {
        std::vector<std::string> command{"ffmpeg",    "-v", "error", "-f", "lavfi", "-i", "testsrc=s=300x200",
                                         "-frames:v", "1"};
        command.insert(command.end(), kind.begin(), kind.end());
        command.push_back(folder / name);
        EXPECT_EQ(run(command).exitCode, 0) << name;
        return readFile(folder / name);
    }
    // "NAME=value|...", without a value for data that has none
    static std::string list(TONEWRIGHT_Handle tags) {
        std::string text;
        for (int32_t i = 0; i < TONEWRIGHT_Host_GetTagEntryCount(tags); ++i) {
            const char *name = nullptr, *value = nullptr;
            EXPECT_EQ(TONEWRIGHT_Host_GetTagEntry(tags, i, &name, &value), 1);
            text += std::string(name) + (value ? std::string("=") + value : "") + "|";
        }
        return text;
    }
};

} // namespace

TEST_F(HostTags, AreReadAndChanged) {
    const std::u16string flac = make("a.flac"), wav = make("b.wav");
    run({"metaflac", "--remove", "--block-type=VORBIS_COMMENT", folder / "a.flac"});
    const CHandle change(TONEWRIGHT_Host_CreateTagChange());
    for (const auto& [name, value] :
         std::vector<std::pair<const char*, const char*>>{{"artist", "One \xf0\x9f\x8e\xb5"},
                                                          {"ARTIST", "Two"},
                                                          {"MOOD", "m"},
                                                          {"TITLE", "not this"},
                                                          {"TITLE", nullptr}})
        EXPECT_EQ(TONEWRIGHT_Host_ChangeTagField(change, name, value), 1);
    for (const char* name : {"", "A=B", "\xc3\xbc", "A\n", static_cast<const char*>(nullptr)})
        EXPECT_EQ(TONEWRIGHT_Host_ChangeTagField(change, name, "x"), 0);
    for (const std::u16string& file : {flac, wav}) {
        EXPECT_EQ(TONEWRIGHT_Host_ApplyTagChange(change, file.c_str()), 1);
        EXPECT_EQ(TONEWRIGHT_Host_ApplyTagChange(change, file.c_str()), 0);
        const CHandle tags(TONEWRIGHT_Host_ReadTags(file.c_str()));
        EXPECT_EQ(list(tags), "ARTIST=One \xf0\x9f\x8e\xb5|ARTIST=Two|MOOD=m|");
        EXPECT_EQ(TONEWRIGHT_Host_GetTagEntry(tags, 3, nullptr, nullptr), 0);
    }
    EXPECT_EQ(TONEWRIGHT_Host_ApplyTagChange(change, make("c.au").c_str()), -1);
    EXPECT_EQ(TONEWRIGHT_Host_ApplyTagChange(nullptr, flac.c_str()), -1);
    EXPECT_EQ(TONEWRIGHT_Host_ReadTags(uriOf(folder / "c.au").c_str()), nullptr);
    EXPECT_EQ(TONEWRIGHT_Host_GetTagEntryCount(nullptr), 0);
    const int32_t whole = TONEWRIGHT_TAG_FIELDS | TONEWRIGHT_TAG_PICTURES;
    EXPECT_EQ(TONEWRIGHT_Host_GetTagSupport(flac.c_str()), whole | TONEWRIGHT_TAG_EXPORTS);
    EXPECT_EQ(TONEWRIGHT_Host_GetTagSupport(u"file:///missing.OPUS"), whole);
    EXPECT_EQ(TONEWRIGHT_Host_GetTagSupport(uriOf(folder / "c.au").c_str()), 0);
}

TEST_F(HostTags, AreCopiedWhole) {
    const std::u16string from = make("a.flac"), flac = make("b.flac"), wav = make("c.wav"),
                         aiff = make("d.aiff");
    run({"metaflac", "--set-tag=COMPOSER=C. Omposer", folder / "a.flac"});
    char* lost = nullptr;
    EXPECT_EQ(TONEWRIGHT_Host_CopyTags(from.c_str(), flac.c_str(), &lost), 1);
    EXPECT_EQ(lost, nullptr);
    const std::string tags = run({"metaflac", "--export-tags-to=-", folder / "b.flac"}).out;
    EXPECT_NE(tags.find("COMPOSER=C. Omposer"), std::string::npos) << tags;
    EXPECT_EQ(TONEWRIGHT_Host_CopyTags(uriOf(folder / "none.flac").c_str(), from.c_str(), &lost), 0);
    EXPECT_NE(std::string(lastFailure().file).find("none.flac"), std::string::npos) << lastFailure().file;
    // TagLib finds only the first of two odd entries of a WAVE file, neither of which has a pad byte.
    {
        const CHandle tag(TONEWRIGHT_CreateFileTag(wav.c_str()));
        TONEWRIGHT_FileTag_SetArtist(tag, u"ab");
        TONEWRIGHT_FileTag_SetTitle(tag, u"even");
        EXPECT_EQ(TONEWRIGHT_StoreFileTag(tag), TONEWRIGHT_OK);
    }
    EXPECT_EQ(TONEWRIGHT_Host_CopyTags(wav.c_str(), aiff.c_str(), &lost), 1);
    EXPECT_EQ(list(CHandle(TONEWRIGHT_Host_ReadTags(aiff.c_str()))), "ARTIST=ab|TITLE=even|");
    EXPECT_EQ(TONEWRIGHT_Host_CopyTags(from.c_str(), wav.c_str(), &lost), 1);
    EXPECT_NE(list(CHandle(TONEWRIGHT_Host_ReadTags(wav.c_str()))).find("TITLE=even|"), std::string::npos);
    folder.write("e.mp3", std::string("ID3\3\0\0\0\0\0\x11PRIV\0\0\0\7\0\0o\0hello", 27));
    EXPECT_EQ(TONEWRIGHT_Host_CopyTags(uriOf(folder / "e.mp3").c_str(), aiff.c_str(), &lost), 1);
    EXPECT_EQ(std::string(Owned<char>(lost).get()).substr(0, 4), "PRIV");
}

TEST_F(HostTags, FormatAndSizeOfPicturesComeFromTheirBytes) {
    const std::u16string flac = make("a.flac");
    using namespace std::string_literals;
    const std::string kPng = "\x89PNG\r\n\x1a\n\0\0\0\x0dIHDR\0\0\2\1\0\0\1\2"s;
    const std::string kJpeg = "\xff\xd8\xff\xff\xc4\0\2\xff\xc8\0\3x\xff\xcc\1\0"s + std::string(254, 'x');
    const struct {
        const char* name;
        const char* mimeType;
        int32_t depth; // in bits
        std::vector<std::string> options;
        std::string bytes = ""; // instead of a file that a program makes; 65538 x 65281 or 513 x 258
    } kCases[] = {{"a.jpg", "image/jpeg", 24, {}},
                  {"c.png", "image/png", 8, {"-pix_fmt", "gray"}},
                  {"a.png", "image/png", 24, {}},
                  {"b.png", "image/png", 64, {"-pix_fmt", "rgba64be"}},
                  {"a.gif", "image/gif", 24, {}},
                  {"a.bmp", "image/bmp", 24, {"-pix_fmt", "bgr24"}},
                  {"b.bmp", "image/bmp", 24, {"-pix_fmt", "bgr24"}},
                  {"a.webp", "image/webp", 0, {"-lossless", "0"}},
                  {"b.webp", "image/webp", 0, {"-lossless", "1"}},
                  {"c.webp", "image/webp", 0, {}, "RIFF....WEBPVP8X........\1\0\1\0\xff\0"s},
                  {"d.jpg", "image/jpeg", 24, {}, kJpeg + "\xff\xcf\0\x11\x08\1\2\2\1\3"s},
                  {"e.jpg", "image/jpeg", 8, {}, "\xff\xd8\xff\xc0\0\x11\x08\1\2\2\1\1"s},
                  {"d.png", "image/png", 24, {}, kPng + "\4\3.."s},
                  {"c.bmp", "image/bmp", 8, {}, "BM............\x0c\0\0\0\1\2\2\1\1\0\x08\0"s}};
    for (const auto& each : kCases) {
        SCOPED_TRACE(each.name);
        const bool isMade = each.bytes.empty();
        std::string bytes = isMade ? makePicture(each.options, each.name) : each.bytes;
        if (each.name == std::string("b.bmp")) bytes.replace(22, 4, "\x38\xff\xff\xff"); // rows from the top
        // Cut anywhere, it is read within its bounds.
        for (size_t size = 0; size <= std::min<size_t>(bytes.size(), 700); ++size) {
            const std::string cut = bytes.substr(0, size);
            auto picture = makeRecord<TONEWRIGHT_TagPicture>();
            picture.data = cut.data();
            picture.dataSize = cut.size();
            TONEWRIGHT_Host_AddTagPicture(CHandle(TONEWRIGHT_Host_CreateTagChange()), &picture);
        }
        TONEWRIGHT_TagPicture picture = {};
        picture.size = offsetof(TONEWRIGHT_TagPicture, mimeType); // as a host of an older version passes it
        picture.data = bytes.data();
        picture.dataSize = bytes.size();
        const CHandle change(TONEWRIGHT_Host_CreateTagChange());
        EXPECT_EQ(TONEWRIGHT_Host_RemoveTagPictures(change, -1), 1);
        EXPECT_EQ(TONEWRIGHT_Host_AddTagPicture(change, &picture), 1);
        EXPECT_EQ(TONEWRIGHT_Host_ApplyTagChange(change, flac.c_str()), 1);
        const CHandle tags(TONEWRIGHT_Host_ReadTags(flac.c_str()));
        ASSERT_EQ(TONEWRIGHT_Host_GetTagPictureCount(tags), 1);
        picture.size = sizeof picture;
        ASSERT_EQ(TONEWRIGHT_Host_GetTagPicture(tags, 0, &picture), 1);
        EXPECT_TRUE(std::string(static_cast<const char*>(picture.data), picture.dataSize) == bytes);
        EXPECT_STREQ(picture.mimeType, each.mimeType);
        const bool isHuge = each.name == std::string("c.webp");
        EXPECT_EQ(picture.width, isMade ? 300 : isHuge ? 65538 : 513);
        EXPECT_EQ(picture.height, isMade ? 200 : isHuge ? 65281 : 258);
        const std::string block = run({"metaflac", "--list", "--block-type=PICTURE", folder / "a.flac"}).out;
        EXPECT_NE(block.find("depth: " + std::to_string(each.depth) + "\n"), std::string::npos)
            << block.substr(0, 500);
        EXPECT_EQ(TONEWRIGHT_Host_GetTagPicture(tags, 1, &picture), 0);
    }
    auto unknown = makeRecord<TONEWRIGHT_TagPicture>();
    unknown.data = "no picture";
    unknown.dataSize = 10;
    const CHandle change(TONEWRIGHT_Host_CreateTagChange());
    EXPECT_EQ(TONEWRIGHT_Host_AddTagPicture(change, &unknown), 0);
    unknown.mimeType = "image/x-own";
    EXPECT_EQ(TONEWRIGHT_Host_AddTagPicture(change, &unknown), 1);
}
