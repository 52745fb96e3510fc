#include "discio2/ProjectSupport.h"

using namespace tests;

TEST(Project, AVirtualAudioDiscIsReadLikeAnyOther) {
    const CTempFolder folder;
    SSource first(makeSectors(3, 1)), odd(makeSectors(2, 2).substr(0, 4 * 600)), early(makeSectors(4, 3));
    early.frames += 588; // ends before its length
    {
        const SProject own(true);
        EXPECT_EQ(DISCIO_DiscIsVirtual(own.disc.get()), 1);
        EXPECT_EQ(DISCIO_DiscHasAudioComponent(own.disc.get()), 1);
        EXPECT_EQ(DISCIO_DiscIsEmpty(own.disc.get()), 1);
        ASSERT_EQ(own.insert(early), 1) << lastError();
        ASSERT_EQ(own.insert(first, 0), 1) << lastError();
        ASSERT_EQ(own.insert(odd, 1), 1) << lastError();
        folder.write("a.wav", toWave(makeSectors(2, 4)));
        const Discio<DISCIO_PCMAudioStream> wave(DISCIO_CreatePCMAudioStreamFromFileW(
            own.library.get(), wide("file://" + (folder / "%61.wav").string()).c_str()));
        ASSERT_EQ(DISCIO_DiscAudioInsertSegmentPCMAudioStream(own.disc.get(), wave.get(), 3), 1)
            << lastError();
        ASSERT_EQ(DISCIO_DiscAudioSetSegmentPregap(own.disc.get(), 2, 10), 1);
        SOpenDisc view((folder / "none").string()); // for its reading
        view.disc.reset(DISCIO_ProjectGetVirtualDisc(own.project.get()));
        EXPECT_EQ(view.describe(), "0+3-150 153+2-150 165+5-10 320+2-150 | 322");
        EXPECT_TRUE(view.readSegment(0) == first.pcm);
        EXPECT_TRUE(view.readSegment(1) == odd.pcm + std::string(4 * 576, '\0'));
        EXPECT_TRUE(view.readSegment(2) == early.pcm + std::string(kSectorBytes, '\0'));
        EXPECT_TRUE(view.readSegment(3) == makeSectors(2, 4));
        // A source without seeking is read again from its beginning.
        const auto stream = view.openSegment(0);
        ASSERT_EQ(stream->funcs->open(stream->user), 1);
        std::string block(4, '\0');
        int32_t delivered = 0;
        for (const size_t frame : {700u, 100u}) {
            ASSERT_EQ(stream->funcs->seek(stream->user, static_cast<int64_t>(frame)), 1);
            ASSERT_EQ(stream->funcs->read(stream->user, block.data(), 1, &delivered), 1);
            EXPECT_TRUE(block == first.pcm.substr(4 * frame, 4)) << frame;
        }
        // One source cannot be in two places, nor a project in itself.
        EXPECT_EQ(own.insert(first), 1);
        EXPECT_EQ(view.readSegment(0), "cannot be opened") << "while it is read above";
        EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_STREAM_ALREADY_OPEN);
        EXPECT_EQ(DISCIO_DiscAudioInsertSegmentPCMAudioStream(own.disc.get(), stream.get(), -1), 0);
        EXPECT_EQ(DISCIO_DiscAudioRemoveSegment(own.disc.get(), 1), 1);
        EXPECT_EQ(odd.ended, 1);
        EXPECT_EQ(first.ended, 0);
    }
    EXPECT_EQ(first.ended, 2); // inserted twice
    EXPECT_EQ(first.opened + odd.opened + early.opened, 0);
}

TEST(Project, BadTracksAreRefused) {
    const SProject own(true), data(false);
    SSource good(makeSectors(1, 1)), mono(good.pcm), none;
    mono.channels = 1;
    EXPECT_EQ(own.insert(mono), 0);
    EXPECT_NE(lastError().find("1 channels at 44100 Hz"), std::string::npos) << lastError();
    EXPECT_EQ(own.insert(none), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_UNSUPPORTED_FORMAT);
    EXPECT_EQ(own.insert(good, 1), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NO_SUCH_OBJECT);
    EXPECT_EQ(data.insert(good), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NO_AUDIO);
    for (int i = 0; i < 99; ++i) ASSERT_EQ(own.insert(good), 1) << lastError();
    EXPECT_EQ(own.insert(good), 0);
    DISCIO_Disc* const disc = own.disc.get();
    EXPECT_EQ(DISCIO_DiscAudioSetSegmentPregap(disc, 0, 0), 0);
    EXPECT_EQ(DISCIO_DiscAudioSetMetaDataStringW(disc, DISCIO_TEXT_CODE, u"123"), 0);
    EXPECT_EQ(DISCIO_DiscAudioSetMetaDataStringW(disc, DISCIO_TEXT_TITLE, u"a\nb"), 0);
    EXPECT_EQ(DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 0, DISCIO_TEXT_GENRE, u"x"), 0);
    EXPECT_EQ(DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 0, DISCIO_TEXT_CODE, u"DEXXX010001"), 0);
    EXPECT_EQ(DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 0, DISCIO_TEXT_CODE, u"DEXXX0100001"), 1);
    EXPECT_EQ(narrow(DISCIO_DiscAudioGetSegmentMetaDataStringW(disc, 0, DISCIO_TEXT_CODE)), "DEXXX0100001");
}

TEST(Project, AVirtualDataDiscListsItsFiles) {
    const CTempFolder folder;
    folder.write("a b.txt", "12345");
    const std::u16string source = wide((folder / "a b.txt").string());
    const SProject own(false);
    DISCIO_Disc* const disc = own.disc.get();
    EXPECT_EQ(DISCIO_DiscHasDataComponent(disc), 1);
    EXPECT_EQ(DISCIO_DiscDataSetTitleW(disc, u"Title"), 1);
    ASSERT_EQ(DISCIO_DiscDataCreateFolderW(disc, u"\\Sub"), 1) << lastError();
    ASSERT_EQ(DISCIO_DiscDataAddFileW(disc, u"Sub/x.txt", source.c_str()), 1) << lastError();
    std::u16string discForm = source;
    std::replace(discForm.begin(), discForm.end(), u'/', u'\\');
    ASSERT_EQ(DISCIO_DiscDataAddFileW(disc, u"z", discForm.c_str()), 1) << lastError();
    const struct {
        const char16_t* path;
        std::u16string source;
        int32_t code;
    } cases[] = {
        {u"Sub\\x.txt", source, DISCIO_ERROR_ALREADY_EXISTS},
        {u"None\\x", source, DISCIO_ERROR_NOT_FOUND},
        {u"z\\x", source, DISCIO_ERROR_NOT_A_FOLDER},
        {u"..", source, DISCIO_ERROR_INVALID_PARAM},
        {u"a\tb", source, DISCIO_ERROR_INVALID_PARAM},
        {u"x", u"relative", DISCIO_ERROR_INVALID_PARAM},
        {u"x", u"file://host/x", DISCIO_ERROR_INVALID_PARAM},
        {u"x", source + u"x", DISCIO_ERROR_NOT_FOUND},
        {u"x", u"/", DISCIO_ERROR_NOT_A_FILE},
    };
    for (const auto& each : cases) {
        EXPECT_EQ(DISCIO_DiscDataAddFileW(disc, each.path, each.source.c_str()), 0);
        EXPECT_EQ(DISCIO_GetLastError(nullptr), each.code) << lastError();
    }
    EXPECT_EQ(DISCIO_DiscDataFolderExistsW(disc, u"Sub\\"), 1);
    const Discio<DISCIO_DataCursor> root(DISCIO_DiscDataCreateCursorW(disc, u""));
    ASSERT_EQ(DISCIO_DataCursorNext(root.get()), 1);
    const Discio<DISCIO_DataCursor> sub(DISCIO_DataCursorCreateSubCursor(root.get()));
    ASSERT_EQ(DISCIO_DataCursorNext(sub.get()), 1);
    EXPECT_EQ(narrow(DISCIO_DataCursorGetDiscPathW(sub.get())), "\\Sub\\x.txt");
    EXPECT_EQ(DISCIO_DataCursorGetSize(sub.get()), 5);
    EXPECT_EQ(narrow(DISCIO_DataCursorGetFileSourceURIW(sub.get())),
              "file://" + (folder.path() / "a%20b.txt").string());
    EXPECT_GT(DISCIO_DataCursorGetLastModifiedTime(sub.get()), 0);
    EXPECT_EQ(DISCIO_DiscDataRemoveW(disc, u"\\Sub"), 1);
    EXPECT_EQ(DISCIO_DiscDataFolderExistsW(disc, u"Sub"), 0);
    EXPECT_EQ(DISCIO_DiscGetCapacityBytes(disc), 2048);
    SOpenDisc image(folder.write("a.iso", std::string(40960, 'x')));
    EXPECT_EQ(DISCIO_DiscDataSetTitleW(image.disc.get(), u"x"), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_NOT_VIRTUAL);
}
