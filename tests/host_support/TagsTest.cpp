// The functions for whole tags; their effect on files of every format is tested with the program.
#include "support/Environment.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>
#include <tonewright/host.h>

#include <memory>

using namespace tests;

namespace {

struct SDestroy {
    void operator()(TONEWRIGHT_Handle handle) const { TONEWRIGHT_Host_DestroyHandle(handle); }
};
using Handle = std::unique_ptr<TONEWRIGHT_HandleData, SDestroy>;

class HostTags : public testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK); }
    void TearDown() override { TONEWRIGHT_DeInitAll(); }

    std::u16string make(const char* name) {
        EXPECT_EQ(run({"sox", "-n", "-r", "44100", "-c", "2", folder / name, "synth", "0.1", "sine", "300"})
                      .exitCode,
                  0);
        return uriOf(name);
    }
    std::u16string uriOf(const char* name) {
        char16_t* const uri = TONEWRIGHT_Host_PathToURI((folder / name).c_str());
        const std::u16string result = uri;
        TONEWRIGHT_Host_Free(uri);
        return result;
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

    CEnvironment quiet{"TONEWRIGHT_DEBUG_OUTPUT", "0"};
    CTempFolder folder;
};

} // namespace

TEST_F(HostTags, AreReadAndChanged) {
    const std::u16string flac = make("a.flac"), wav = make("b.wav");
    run({"metaflac", "--remove", "--block-type=VORBIS_COMMENT", folder / "a.flac"});
    const Handle change(TONEWRIGHT_Host_CreateTagChange());
    for (const auto& [name, value] : std::vector<std::pair<const char*, const char*>>{
             {"artist", "One \xf0\x9f\x8e\xb5"}, {"ARTIST", "Two"}, {"MOOD", "m"}, {"TITLE", nullptr}})
        EXPECT_EQ(TONEWRIGHT_Host_ChangeTagField(change.get(), name, value), 1);
    for (const char* name : {"", "A=B", "\xc3\xbc", "A\n", static_cast<const char*>(nullptr)})
        EXPECT_EQ(TONEWRIGHT_Host_ChangeTagField(change.get(), name, "x"), 0);
    for (const std::u16string& file : {flac, wav}) {
        EXPECT_EQ(TONEWRIGHT_Host_ApplyTagChange(change.get(), file.c_str()), 1);
        EXPECT_EQ(TONEWRIGHT_Host_ApplyTagChange(change.get(), file.c_str()), 0);
        const Handle tags(TONEWRIGHT_Host_ReadTags(file.c_str()));
        EXPECT_EQ(list(tags.get()), "ARTIST=One \xf0\x9f\x8e\xb5|ARTIST=Two|MOOD=m|");
        EXPECT_EQ(TONEWRIGHT_Host_GetTagEntry(tags.get(), 3, nullptr, nullptr), 0);
    }
    EXPECT_EQ(TONEWRIGHT_Host_ApplyTagChange(change.get(), make("c.au").c_str()), -1);
    EXPECT_EQ(TONEWRIGHT_Host_ApplyTagChange(nullptr, flac.c_str()), -1);
    EXPECT_EQ(TONEWRIGHT_Host_ReadTags(uriOf("c.au").c_str()), nullptr);
    EXPECT_EQ(TONEWRIGHT_Host_GetTagEntryCount(nullptr), 0);
    const int32_t whole = TONEWRIGHT_TAG_FIELDS | TONEWRIGHT_TAG_PICTURES;
    EXPECT_EQ(TONEWRIGHT_Host_GetTagSupport(flac.c_str()), whole | TONEWRIGHT_TAG_EXPORTS);
    EXPECT_EQ(TONEWRIGHT_Host_GetTagSupport(u"file:///missing.OPUS"), whole);
    EXPECT_EQ(TONEWRIGHT_Host_GetTagSupport(uriOf("c.au").c_str()), 0);
}

TEST_F(HostTags, FormatAndSizeOfPicturesComeFromTheirBytes) {
    const std::u16string flac = make("a.flac");
    const struct {
        const char* name;
        const char* mimeType;
        int32_t depth; // in bits
        std::vector<std::string> options;
    } kCases[] = {{"a.jpg", "image/jpeg", 24, {}},
                  {"c.png", "image/png", 8, {"-pix_fmt", "gray"}},
                  {"a.png", "image/png", 24, {}},
                  {"b.png", "image/png", 64, {"-pix_fmt", "rgba64be"}},
                  {"a.gif", "image/gif", 24, {}},
                  {"a.bmp", "image/bmp", 24, {"-pix_fmt", "bgr24"}},
                  {"a.webp", "image/webp", 0, {"-lossless", "0"}},
                  {"b.webp", "image/webp", 0, {"-lossless", "1"}}};
    for (const auto& each : kCases) {
        SCOPED_TRACE(each.name);
        const std::string bytes = makePicture(each.options, each.name);
        // Cut anywhere, it is read within its bounds.
        for (size_t size = 0; size <= std::min<size_t>(bytes.size(), 700); ++size) {
            const std::string cut = bytes.substr(0, size);
            TONEWRIGHT_TagPicture picture = {};
            picture.size = sizeof picture;
            picture.data = cut.data();
            picture.dataSize = cut.size();
            TONEWRIGHT_Host_AddTagPicture(Handle(TONEWRIGHT_Host_CreateTagChange()).get(), &picture);
        }
        TONEWRIGHT_TagPicture picture = {};
        picture.size = offsetof(TONEWRIGHT_TagPicture, mimeType); // as a host of an older version passes it
        picture.data = bytes.data();
        picture.dataSize = bytes.size();
        const Handle change(TONEWRIGHT_Host_CreateTagChange());
        EXPECT_EQ(TONEWRIGHT_Host_RemoveTagPictures(change.get(), -1), 1);
        EXPECT_EQ(TONEWRIGHT_Host_AddTagPicture(change.get(), &picture), 1);
        EXPECT_EQ(TONEWRIGHT_Host_ApplyTagChange(change.get(), flac.c_str()), 1);
        const Handle tags(TONEWRIGHT_Host_ReadTags(flac.c_str()));
        ASSERT_EQ(TONEWRIGHT_Host_GetTagPictureCount(tags.get()), 1);
        picture.size = sizeof picture;
        ASSERT_EQ(TONEWRIGHT_Host_GetTagPicture(tags.get(), 0, &picture), 1);
        EXPECT_TRUE(std::string(static_cast<const char*>(picture.data), picture.dataSize) == bytes);
        EXPECT_STREQ(picture.mimeType, each.mimeType);
        EXPECT_EQ(picture.width, 300);
        EXPECT_EQ(picture.height, 200);
        const std::string block = run({"metaflac", "--list", "--block-type=PICTURE", folder / "a.flac"}).out;
        EXPECT_NE(block.find("depth: " + std::to_string(each.depth) + "\n"), std::string::npos)
            << block.substr(0, 500);
        EXPECT_EQ(TONEWRIGHT_Host_GetTagPicture(tags.get(), 1, &picture), 0);
    }
    TONEWRIGHT_TagPicture unknown = {};
    unknown.size = sizeof unknown;
    unknown.data = "no picture";
    unknown.dataSize = 10;
    const Handle change(TONEWRIGHT_Host_CreateTagChange());
    EXPECT_EQ(TONEWRIGHT_Host_AddTagPicture(change.get(), &unknown), 0);
    unknown.mimeType = "image/x-own";
    EXPECT_EQ(TONEWRIGHT_Host_AddTagPicture(change.get(), &unknown), 1);
}
