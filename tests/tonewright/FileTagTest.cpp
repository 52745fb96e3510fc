#include "Library.h"

#include "support/Process.h"

namespace {

using namespace tests;

std::u16string take(TONEWRIGHT_Handle handle) {
    CHandle text(handle);
    if (!text) return u"<null>";
    return {TONEWRIGHT_GetText(text.get()), TONEWRIGHT_GetTextLength(text.get())};
}

struct SField {
    const char* name;
    TONEWRIGHT_Handle (*get)(TONEWRIGHT_Handle);
    void (*set)(TONEWRIGHT_Handle, const char16_t*);
    const char* judged; // its name in another program
};
#define FIELD(name, judged)                                                                                  \
    { #name, TONEWRIGHT_FileTag_Get##name, TONEWRIGHT_FileTag_Set##name, judged }
const SField kFields[] = {FIELD(Title, "TITLE"),
                          FIELD(Artist, "ARTIST"),
                          FIELD(Album, "ALBUM"),
                          FIELD(AlbumArtist, "ALBUMARTIST"),
                          FIELD(TrackNumber, "TRACKNUMBER"),
                          FIELD(Year, "DATE"),
                          FIELD(Genre, "GENRE"),
                          FIELD(Comment, "COMMENT")};

class FileTag : public CLibraryTest {
protected:
    CHandle makeTag(const std::string& name) {
        return CHandle(TONEWRIGHT_CreateFileTag(uriOf(folder / name).c_str()));
    }
    void makeSound(const std::string& name, const char* format) {
        ASSERT_EQ(
            run({"sox", "-n", "--comment", "", "-t", format, (folder / name).string(), "trim", "0", "0.1"})
                .exitCode,
            0);
    }

    CTempFolder folder;
};

TEST_F(FileTag, Fields_CrossTheBoundaryAndTheFile) {
    makeSound("a.flac", "flac");
    // Each text differs, contains a character outside the BMP, and exceeds a handle's inline storage.
    const auto textOf = [](const SField& field) {
        const std::string name = field.name;
        return std::u16string(name.begin(), name.end()) + u" \U0001F3B5 3/12 \u00e4\u97f3 and more";
    };
    {
        CHandle tag = makeTag("a.flac");
        ASSERT_TRUE(tag);
        for (const SField& field : kFields) {
            EXPECT_EQ(take(field.get(tag.get())), u"") << field.name;
            field.set(tag.get(), textOf(field).c_str());
        }
        for (const SField& field : kFields)
            EXPECT_EQ(take(field.get(tag.get())), textOf(field)) << field.name;
        EXPECT_EQ(take(makeTag("a.flac") ? TONEWRIGHT_FileTag_GetTitle(makeTag("a.flac").get()) : nullptr),
                  u"")
            << "nothing is written before the store";
        EXPECT_EQ(TONEWRIGHT_StoreFileTag(tag.get()), 0);
    }
    CHandle tag = makeTag("a.flac");
    for (const SField& field : kFields) {
        EXPECT_EQ(take(field.get(tag.get())), textOf(field)) << field.name;
        const SProcessResult judge =
            run({"metaflac", "--no-utf8-convert", std::string("--show-tag=") + field.judged,
                 (folder / "a.flac").string()});
        EXPECT_EQ(judge.out,
                  std::string(field.judged) + "=" + field.name + " \U0001F3B5 3/12 \u00e4\u97f3 and more\n");
    }
    // Both remove the field.
    TONEWRIGHT_FileTag_SetTitle(tag.get(), nullptr);
    TONEWRIGHT_FileTag_SetArtist(tag.get(), u"");
    EXPECT_EQ(TONEWRIGHT_StoreFileTag(tag.get()), 0);
    tag = makeTag("a.flac");
    EXPECT_EQ(take(TONEWRIGHT_FileTag_GetTitle(tag.get())), u"");
    EXPECT_EQ(take(TONEWRIGHT_FileTag_GetArtist(tag.get())), u"");
    EXPECT_EQ(take(TONEWRIGHT_FileTag_GetAlbum(tag.get())), textOf(kFields[2]));
}

TEST_F(FileTag, Kind_IsToldByTheExtensionAndItsAbsenceIsNoFailure) {
    makeSound("UPPER.FLAC", "flac");
    makeSound("a.flac.part", "flac");
    makeSound("a.flac", "flac");
    folder.write("no.flac", "no sound");
    log->take();
    EXPECT_TRUE(makeTag("UPPER.FLAC"));
    for (const char* unknown : {"a.flac.part", "missing.txt", "flac", "a."})
        EXPECT_FALSE(makeTag(unknown)) << unknown;
    EXPECT_FALSE(TONEWRIGHT_CreateFileTag(nullptr));
    EXPECT_TRUE(log->take().empty());
    for (const char* bad : {"no.flac", "missing.flac"}) {
        EXPECT_FALSE(makeTag(bad));
        const std::vector<SLine> lines = log->take();
        ASSERT_EQ(lines.size(), 1u) << bad;
        EXPECT_EQ(lines[0].level, 5);
        EXPECT_NE(lines[0].text.find(bad), std::string::npos) << lines[0].text;
    }
    TONEWRIGHT_SetTempExtension(u".part");
    EXPECT_TRUE(makeTag("a.flac.part"));
    EXPECT_TRUE(makeTag("a.flac"));
    TONEWRIGHT_SetTempExtension(nullptr);
    EXPECT_FALSE(makeTag("a.flac.part"));
}

} // namespace
