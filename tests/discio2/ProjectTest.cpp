#include "discio2/ProjectSupport.h"

#include <ctime>
#include <set>

using namespace tests;

TEST(Project, AVirtualAudioDiscIsReadLikeAnyOther) {
    const CTempFolder folder;
    SSource first(makeSectors(3, 1)), odd(makeSectors(2, 2).substr(0, 4 * 589)), early(makeSectors(4, 3));
    early.frames += 1176; // ends before its length
    {
        const SProject own(true);
        EXPECT_EQ(DISCIO_DiscIsVirtual(own.disc.get()), 1);
        EXPECT_EQ(DISCIO_DiscHasAudioComponent(own.disc.get()), 1);
        EXPECT_EQ(DISCIO_DiscIsEmpty(own.disc.get()) + DISCIO_DiscIsWritable(own.disc.get()), 2);
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
        EXPECT_EQ(view.describe(), "0+3-150 153+2-150 165+6-10 321+2-150 | 323");
        EXPECT_TRUE(view.readSegment(0) == first.pcm);
        EXPECT_TRUE(view.readSegment(1) == odd.pcm + std::string(4 * 587, '\0'));
        EXPECT_TRUE(view.readSegment(2) == early.pcm + std::string(2 * kSectorBytes, '\0'));
        EXPECT_TRUE(view.readSegment(3) == makeSectors(2, 4));
        // A source without seeking is read again from its beginning.
        const auto stream = view.openSegment(0);
        ASSERT_EQ(stream->funcs->open(stream->user), 1);
        for (const int32_t canSeek : {0, 1}) {
            early.canSeek = canSeek;
            early.rewinds = 0;
            const auto other = view.openSegment(2);
            ASSERT_EQ(other->funcs->open(other->user), 1);
            std::string block(4, '\0');
            int32_t delivered = 0;
            for (const size_t frame : {700u, 100u, 3527u, 2351u}) {
                ASSERT_EQ(other->funcs->seek(other->user, static_cast<int64_t>(frame)), 1);
                ASSERT_EQ(other->funcs->read(other->user, block.data(), 1, &delivered), 1);
                EXPECT_TRUE(block == (early.pcm + std::string(2 * kSectorBytes, '\0')).substr(4 * frame, 4))
                    << frame;
                EXPECT_EQ(other->funcs->getPosition(other->user), static_cast<int64_t>(frame) + 1);
            }
            EXPECT_EQ(early.rewinds, canSeek ? 1 : 3);
        }
        for (const auto& [seeks, surplus] : {std::pair{0, 0}, {1, 1 << 20}, {1, -(1 << 20)}}) {
            early.seeks = seeks;
            early.surplus = surplus;
            const auto lost = view.openSegment(2);
            ASSERT_EQ(lost->funcs->open(lost->user), 1);
            ASSERT_EQ(lost->funcs->seek(lost->user, 588), 1);
            char frame[4];
            int32_t delivered = 0;
            EXPECT_EQ(lost->funcs->read(lost->user, frame, 1, &delivered), 0);
            EXPECT_NE(lastError().find("track 3: the source cannot be read at frame 588"), std::string::npos);
        }
        // A file is a stream of its own.
        ASSERT_EQ(wave->funcs->open(wave->user), 1);
        for (const auto& [frame, result, left] :
             {std::tuple(-1, 0, 1176), {1177, 0, 1176}, {1176, 1, 0}, {0, 1, 1176}, {5, 1, 1171}}) {
            std::string block(4 * 1176, '\0');
            int32_t delivered = 0;
            EXPECT_EQ(wave->funcs->seek(wave->user, frame), result);
            EXPECT_EQ(wave->funcs->read(wave->user, block.data(), 1176, &delivered), 1);
            EXPECT_EQ(delivered, left);
            EXPECT_EQ(block.substr(0, 4 * static_cast<size_t>(left)),
                      makeSectors(2, 4).substr(2 * kSectorBytes - 4 * static_cast<size_t>(left)));
            wave->funcs->rewind(wave->user);
        }
        // One source cannot be in two places, nor a project in itself.
        EXPECT_EQ(own.insert(first), 1);
        view.readSegment(0); // while it is read above
        EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_STREAM_ALREADY_OPEN);
        EXPECT_EQ(DISCIO_DiscAudioInsertSegmentPCMAudioStream(own.disc.get(), stream.get(), -1), 0);
        EXPECT_EQ(DISCIO_DiscAudioRemoveSegment(own.disc.get(), 1), 1);
        EXPECT_EQ(odd.ended, 1);
        folder.write("a.bin", makeSectors(2, 4));
        const SOpenDisc image(
            folder.write("a.cue", "FILE a.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n"));
        EXPECT_EQ(DISCIO_DiscAudioInsertSegmentPCMAudioStream(own.disc.get(), image.openSegment(0).get(), -1),
                  1);
        EXPECT_EQ(first.ended, 0);
    }
    EXPECT_EQ(first.ended, 2); // inserted twice
    EXPECT_EQ(first.opened + odd.opened + early.opened, 0);
}

TEST(Project, BadTracksAreRefused) {
    const SProject own(true), data(false);
    SSource good(makeSectors(1, 1)), other(good.pcm);
    const auto refuse = [&](const SProject& project, SSource source, int32_t code, const char* reason,
                            int place = -1) {
        EXPECT_EQ(project.insert(source, place), 0);
        EXPECT_EQ(DISCIO_GetLastError(nullptr), code);
        EXPECT_NE(lastError().find(reason), std::string::npos) << lastError();
        EXPECT_EQ(source.opened, 0);
    };
    const auto with = [&](auto SSource::*member, auto value) {
        SSource source(good.pcm);
        source.*member = value;
        return source;
    };
    refuse(own, with(&SSource::channels, 1), DISCIO_ERROR_UNSUPPORTED_FORMAT, "1 channels at 44100 Hz");
    refuse(own, with(&SSource::rate, 48000), DISCIO_ERROR_UNSUPPORTED_FORMAT, "2 channels at 48000 Hz");
    refuse(own, with(&SSource::frames, 0), DISCIO_ERROR_UNSUPPORTED_FORMAT, "the source is empty");
    refuse(own, with(&SSource::canOpen, 0), DISCIO_ERROR_READ_INPUT, "the source cannot be opened");
    refuse(own, with(&SSource::canRewind, 0), DISCIO_ERROR_READ_INPUT, "cannot be read from its beginning");
    refuse(own, good, DISCIO_ERROR_NO_SUCH_OBJECT, "place 1", 1);
    refuse(own, good, DISCIO_ERROR_NO_SUCH_OBJECT, "place -2", -2);
    refuse(data, good, DISCIO_ERROR_NO_AUDIO, "");
    refuse(own, with(&SSource::frames, 449850 * 588), DISCIO_ERROR_NOT_ENOUGH_SPACE, "less than 100 minutes");
    SSource longest = with(&SSource::frames, 449849 * 588);
    EXPECT_EQ(own.insert(longest), 1);
    DISCIO_Disc* const disc = own.disc.get();
    EXPECT_EQ(DISCIO_DiscGetCapacityBytes(disc), 449849LL * 2048);
    // A track that has moved, has another length or is gone cannot be read.
    const Discio<DISCIO_PCMAudioStream> moved(DISCIO_DiscAudioCreatePCMAudioStreamFromSegment(disc, 0));
    const auto expectLost = [&] {
        EXPECT_EQ(moved->funcs->open(moved->user), 0);
        EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_LOST);
    };
    EXPECT_EQ(DISCIO_DiscAudioRemoveSegment(disc, 0), 1);
    expectLost();
    for (int i = 0; i < 99; ++i) ASSERT_EQ(own.insert(good), 1) << lastError();
    expectLost();
    refuse(own, good, DISCIO_ERROR_NOT_SUPPORTED, "99 tracks");
    const Discio<DISCIO_PCMAudioStream> second(DISCIO_DiscAudioCreatePCMAudioStreamFromSegment(disc, 1));
    const std::tuple<int, int, int> pregaps[] = {{0, 0, 0},     {0, 150, 1}, {1, -1, 0},   {1, 22501, 0},
                                                 {1, 22500, 1}, {1, 0, 1},   {99, 150, 0}, {-1, 150, 0}};
    for (const auto& [segment, blocks, result] : pregaps)
        EXPECT_EQ(DISCIO_DiscAudioSetSegmentPregap(disc, segment, blocks), result) << blocks;
    EXPECT_EQ(second->funcs->open(second->user), 0);
    // 2 if the disc takes a text, 1 if a track does.
    const auto take = [&](int32_t text, const std::u16string& value) {
        const int32_t forDisc = DISCIO_DiscAudioSetMetaDataStringW(disc, text, value.c_str());
        const int32_t forTrack = DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 0, text, value.c_str());
        EXPECT_TRUE(forDisc == 0 || getText(own.disc, -1, text) == value);
        EXPECT_TRUE(forTrack == 0 || getText(own.disc, 0, text) == value);
        return 2 * forDisc + forTrack;
    };
    for (const int32_t text : {-1, 6, 7, 8, 13, 15})
        EXPECT_EQ(take(text, u"x"), text == 6 || text == 7 ? 2 : 0);
    EXPECT_EQ(take(5, u"x") + take(14, u"") + take(1, u" ~") + take(0, std::u16string(160, u'\u00E4')), 12);
    EXPECT_EQ(take(1, u"a\x1F") + take(1, u"a\x7F") + take(0, std::u16string(161, u'\u00E4')), 0);
    EXPECT_EQ(take(14, u"0123456789019"), 2);
    EXPECT_EQ(take(14, u"AZA0Z0900099") + take(14, u"ZA9Z00123456"), 2);
    for (const char16_t* code :
         {u"012345678901", u"012345678901/", u":123456789012", u"01234567890123", u"@ZA0Z0900099",
          u"A[A0Z0900099", u"A0A0Z0900099", u"AZ/0Z0900099", u"AZA:Z0900099", u"AZA0@0900099",
          u"AZA0Z/900099", u"AZA0Z09000:9", u"AZA0ZA900099", u"AZA0Z090009", u"AZA0Z09000999"})
        EXPECT_EQ(take(14, code), 0) << narrow(code);
    EXPECT_EQ(DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 99, DISCIO_TEXT_TITLE, u"x"), 0);
    // Functions that a stream needs.
    for (size_t i = 0; i < sizeof(DISCIO_PCMAudioStreamFuncs) / sizeof(void*); ++i) {
        DISCIO_PCMAudioStreamFuncs functions = SSource::getFuncs();
        std::memset(reinterpret_cast<char*>(&functions) + i * sizeof(void*), 0, sizeof(void*));
        const Discio<DISCIO_PCMAudioStream> stream(
            DISCIO_CreatePCMAudioStreamFromFuncs(own.library.get(), &functions, &other));
        EXPECT_EQ(stream != nullptr, !std::set<size_t>({2, 3, 4, 5, 6, 7, 10}).contains(i)) << i;
    }
    EXPECT_EQ(other.ended, 7);
}

TEST(Project, AVirtualDataDiscListsItsFiles) {
    const CTempFolder folder;
    folder.write("a b\xE4.txt", "12345"); // is not UTF-8
    folder.write(":@[`{%09AZaz", std::string(2049, 'x'));
    std::filesystem::create_symlink("loop", folder / "loop");
    const std::u16string base = wide(folder.path().string()), source = base + u"/a b\xDCE4.txt";
    const SProject own(false);
    DISCIO_Disc* const disc = own.disc.get();
    EXPECT_EQ(DISCIO_DiscHasDataComponent(disc) + DISCIO_DiscIsWritable(disc), 2);
    EXPECT_EQ(DISCIO_DiscDataSetTitleW(disc, std::u16string(33, u'x').c_str()), 0);
    EXPECT_EQ(DISCIO_DiscDataSetTitleW(disc, std::u16string(32, u'x').c_str()), 1);
    ASSERT_EQ(DISCIO_DiscDataCreateFolderW(disc, u"\\Sub"), 1) << lastError();
    ASSERT_EQ(DISCIO_DiscDataAddFileW(disc, u"Sub/x.txt", source.c_str()), 1) << lastError();
    std::u16string discForm = source;
    std::replace(discForm.begin(), discForm.end(), u'/', u'\\');
    ASSERT_EQ(DISCIO_DiscDataAddFileW(disc, u"z", discForm.c_str()), 1) << lastError();
    const auto refuse = [&](int32_t code, const std::vector<std::u16string>& paths,
                            const std::vector<std::u16string>& from) {
        for (const std::u16string& path : paths)
            for (const std::u16string& each : from) {
                EXPECT_EQ(DISCIO_DiscDataAddFileW(disc, path.c_str(), each.c_str()), 0);
                EXPECT_EQ(DISCIO_GetLastError(nullptr), code) << lastError();
            }
    };
    refuse(DISCIO_ERROR_ALREADY_EXISTS, {u"Sub\\x.txt"}, {source});
    refuse(DISCIO_ERROR_NOT_FOUND, {u"None\\x"}, {source});
    refuse(DISCIO_ERROR_NOT_A_FOLDER, {u"z\\x"}, {source});
    refuse(DISCIO_ERROR_INVALID_PARAM,
           {u"\\/", u".", u"..", u"a\tb", u"a\x7F", u"a\x1F", std::u16string(256, u'n')}, {source});
    refuse(DISCIO_ERROR_INVALID_PARAM, {u"x"},
           {u"file:///%4", u"file:///%4g", u"file:///%00", u"file:////host", u"relative", u"file://host/x"});
    refuse(DISCIO_ERROR_NOT_FOUND, {u"x"}, {source + u"x", source + u"/x"});
    refuse(DISCIO_ERROR_READ_INPUT, {u"x"}, {base + u"/loop"});
    refuse(DISCIO_ERROR_NOT_A_FILE, {u"x"}, {u"/"});
    std::u16string deep = u"Sub";
    for (int i = 2; i <= 127; ++i) ASSERT_EQ(DISCIO_DiscDataCreateFolderW(disc, (deep += u"\\n").c_str()), 1);
    EXPECT_EQ(DISCIO_DiscDataCreateFolderW(disc, (deep + u"\\n").c_str()), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NOT_SUPPORTED);
    for (const std::u16string& uri :
         {u"file:" + base + u"/%3a@[`{%2509AZaz", u"file://localhost" + base + u"/:%40[%60{%2509AZaz"})
        ASSERT_EQ(
            DISCIO_DiscDataAddFileW(
                disc,
                (uri[6] == u'/' ? u"Sub/" + std::u16string(255, u' ') : std::u16string(u"Sub/ ~a")).c_str(),
                uri.c_str()),
            1)
            << lastError();
    EXPECT_EQ(DISCIO_DiscGetCapacityBytes(disc), 6 * 2048);
    EXPECT_EQ(DISCIO_DiscGetTrackLengthBlocks(disc, 0), 6);
    EXPECT_EQ(DISCIO_DiscDataFolderExistsW(disc, u"Sub\\"), 1);
    const Discio<DISCIO_DataCursor> root(DISCIO_DiscDataCreateCursorW(disc, u""));
    ASSERT_EQ(DISCIO_DataCursorNext(root.get()), 1);
    const Discio<DISCIO_DataCursor> sub(DISCIO_DataCursorCreateSubCursor(root.get()));
    std::string uris;
    while (DISCIO_DataCursorNext(sub.get()) == 1 && narrow(DISCIO_DataCursorGetNameW(sub.get())) != "x.txt")
        uris += narrow(DISCIO_DataCursorGetFileSourceURIW(sub.get())) + "|";
    const std::string uri = "file://" + (folder.path() / ":@%5B%60%7B%2509AZaz").string() + "|";
    EXPECT_EQ(uris, uri + uri + "|");
    EXPECT_EQ(narrow(DISCIO_DataCursorGetDiscPathW(sub.get())), "\\Sub\\x.txt");
    EXPECT_EQ(DISCIO_DataCursorGetSize(sub.get()), 5);
    EXPECT_EQ(narrow(DISCIO_DataCursorGetFileSourceURIW(sub.get())),
              "file://" + (folder.path() / "a%20b%E4.txt").string());
    for (const auto get : {DISCIO_DataCursorGetLastModifiedTime, DISCIO_DataCursorGetLastAccessedTime})
        for (const auto& cursor : {&root, &sub})
            EXPECT_LT(std::abs(get(cursor->get()) - std::time(nullptr)), 600);
    EXPECT_EQ(DISCIO_DiscDataRemoveW(disc, u"\\None") + DISCIO_DiscDataRemoveW(disc, u"\\Sub"), 1);
    EXPECT_EQ(DISCIO_DiscDataFolderExistsW(disc, u"Sub"), 0);
    EXPECT_EQ(DISCIO_DiscGetCapacityBytes(disc), 2048);
    SOpenDisc image(folder.write("a.iso", std::string(40960, 'x')));
    EXPECT_EQ(DISCIO_DiscDataSetTitleW(image.disc.get(), u"x"), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_NOT_VIRTUAL);
}
