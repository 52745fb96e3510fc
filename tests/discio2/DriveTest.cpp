#include "discio2/DiscSupport.h"
#include "support/BadHandles.h"
#include "support/Environment.h"

using namespace tests;

// The first complete image is the medium; one whose files are still missing is none.
TEST(Drive, AFolderOfImagesIsADrive) {
    const CTempFolder folder;
    const CEnvironment environment("TONEWRIGHT_DRIVE_FOLDERS",
                                   folder.path().string() + "/:relative:/nowhere");
    const Discio<DISCIO_Library> library(DISCIO_Create());
    ASSERT_EQ(DISCIO_EnumerateDrives(library.get()), 1);
    const int last = DISCIO_GetDriveCount(library.get()) - 1; // the machine may have others
    ASSERT_GE(last, 0);
    const Discio<DISCIO_Drive> drive(DISCIO_OpenDrive(library.get(), last));
    EXPECT_EQ(narrow(DISCIO_DriveGetPathW(drive.get())), folder.path().string());
    EXPECT_EQ(narrow(DISCIO_DriveGetDriverDescriptionW(drive.get())), "folder of disc images");
    EXPECT_EQ(DISCIO_DriveGetReadSpeedList(drive.get()), nullptr);
    EXPECT_EQ(DISCIO_DriveCheckDisc(drive.get(), 0, 0), 0);
    EXPECT_EQ(DISCIO_GetLastError(library.get()), DISCIO_ERROR_NO_DISC);
    EXPECT_FALSE(Discio<DISCIO_Disc>(DISCIO_DriveOpenDisc(drive.get())));
    folder.write("a.cue", "FILE a.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n");
    EXPECT_EQ(DISCIO_DriveCheckDisc(drive.get(), 0, 0), 0);
    folder.write("a.bin", makeSectors(3, 1));
    EXPECT_EQ(DISCIO_DriveCheckDisc(drive.get(), 0, 0), 1);
    const Discio<DISCIO_Disc> disc(DISCIO_DriveOpenDisc(drive.get()));
    EXPECT_EQ(DISCIO_DiscGetTrackLengthBlocks(disc.get(), 0), 3);
    EXPECT_EQ(DISCIO_DiscGetMediumType(disc.get()), 1);
    EXPECT_EQ(DISCIO_DriveOpenTray(drive.get()), 0);
    EXPECT_EQ(DISCIO_GetLastError(library.get()), DISCIO_ERROR_NOT_SUPPORTED);
    for (const auto& [name, exists] : {std::pair{"a.cue", 1}, {"b.cue", 0}}) {
        const SOpenDisc image(folder / name);
        EXPECT_EQ(narrow(DISCIO_DriveGetNameW(image.drive.get())), name);
        EXPECT_EQ(narrow(DISCIO_DriveGetDriverDescriptionW(image.drive.get())), "disc image");
        EXPECT_EQ(DISCIO_DriveCheckDisc(image.drive.get(), 0, 0), exists);
    }
}

// What is no UTF-8 in a path is shown as one surrogate a byte, and such surrogates are bytes of a path.
TEST(Drive, PathsOfAnyBytesKeepThem) {
    const auto pathOf = [](const std::u16string& path) -> std::u16string {
        const DISCIO_Options options{sizeof options, 0, path.c_str()};
        const Discio<DISCIO_Library> library(DISCIO_CreateEx(DISCIO_API_VERSION, &options));
        DISCIO_EnumerateDrives(library.get());
        return DISCIO_DriveGetPathW(Discio<DISCIO_Drive>(DISCIO_OpenDrive(library.get(), 0)).get());
    };
    const auto escape = [](std::string_view bytes) {
        std::u16string text(bytes.size(), u'\xDC00');
        for (size_t i = 0; i < bytes.size(); ++i) text[i] += static_cast<unsigned char>(bytes[i]);
        return text;
    };
    std::vector<std::pair<std::u16string, std::u16string>> cases{
        {u"\xDC00\xDC7F\xDBFF\xD800", u"\uFFFD\uFFFD\uFFFD\uFFFD"},
        {escape("\xC2\x80\xE0\xA0\x80\xED\x9F\xBF"), u"\x80\u0800\uD7FF"},
        {escape("\xEE\x80\x80\xF0\x90\x80\x80\xF4\x8F\xBF\xBF"), u"\uE000\U00010000\U0010FFFF"}};
    for (const char16_t* path :
         {u"\x7F\x80\u07FF\u0800\uD7FF\uE000\uFFFF", u"\U00010000\U0010FFFF\U0001D11E"})
        cases.emplace_back(path, path);
    for (const char16_t lone : {0xD800, 0xDBFF, 0xDC00, 0xDC7F, 0xDD00, 0xDFFF})
        cases.emplace_back(lone + std::u16string(u"\uE000") + lone, u"\uFFFD\uE000\uFFFD");
    for (const char* bytes :
         {"\x80", "\xFF", "\xC1\xBF", "\xC2", "\xE0\x9F\xBF", "\xED\xA0\x80", "\xED\xBF\xBF", "\xE2\x80",
          "\xF0\x8F\xBF\xBF", "\xF4\x90\x80\x80", "\xF5\x80\x80\x80", "\xC3\xC4"})
        cases.emplace_back(escape(bytes) + u"/" + escape(bytes), escape(bytes) + u"/" + escape(bytes));
    for (const auto& [path, shown] : cases) EXPECT_EQ(pathOf(path), shown);
    std::string texts;
    for (const int code : {0, 40, 41, -1}) texts += narrow(DISCIO_GetErrorMessageW(nullptr, code));
    EXPECT_EQ(texts, "No error occurred.The source disc is lost.Unknown error.Unknown error.");
}

TEST(Drive, BadHandlesAreRefused) {
    const Discio<DISCIO_Library> library(DISCIO_Create());
    for (const DISCIO_Options& bad :
         {DISCIO_Options{sizeof(DISCIO_Options), 0, u""}, {sizeof(DISCIO_Options) - 1, 0, u"/a.iso"}}) {
        EXPECT_EQ(DISCIO_CreateEx(DISCIO_API_VERSION, &bad), nullptr);
        EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_INVALID_PARAM);
    }
    EXPECT_EQ(DISCIO_CreateEx(99, nullptr), nullptr);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_UNSUPPORTED_API_VERSION);
    void* const wrong = library.get();
    expectRefused(wrong, -1.0, DISCIO_DiscGetMediumType, DISCIO_DiscGetCapacityBytes,
                  DISCIO_DiscGetFreeSpaceFraction, DISCIO_DiscGetComponentCount, DISCIO_DiscGetComponentType,
                  DISCIO_DiscGetTrackCount, DISCIO_DiscGetTrackLengthBlocks, DISCIO_DiscGetTrackPregap,
                  DISCIO_DiscAudioGetSegmentCount, DISCIO_PCMAudioStreamGetApproximateLengthSeconds,
                  DISCIO_DataCursorGetSize, DISCIO_DataCursorRead, DISCIO_DataCursorGetCreatedTime,
                  DISCIO_DataCursorGetLastModifiedTime, DISCIO_DataCursorGetLastAccessedTime);
    expectRefused(wrong, INT32_MIN, DISCIO_DiscGetTrackStartBlocks);
    expectRefused(
        wrong, 0, DISCIO_DriveCheckDisc, DISCIO_DriveOpenTray, DISCIO_DriveCloseTray, DISCIO_DiscIsEmpty,
        DISCIO_DiscIsErasable, DISCIO_DiscIsVirtual, DISCIO_DiscIsWritable, DISCIO_DiscHasAudioComponent,
        DISCIO_DiscHasDataComponent, DISCIO_DiscDataSetTitleW, DISCIO_DiscDataFolderExistsW,
        DISCIO_DataCursorNext, DISCIO_DataCursorReset, DISCIO_DataCursorIsFile, DISCIO_DataCursorIsFolder,
        DISCIO_DiscAudioInsertSegmentPCMAudioStream, DISCIO_DiscAudioRemoveSegment,
        DISCIO_DiscAudioSetSegmentPregap, DISCIO_DiscAudioSetMetaDataStringW,
        DISCIO_DiscAudioSetSegmentMetaDataStringW, DISCIO_DiscDataAddFileW, DISCIO_DiscDataCreateFolderW,
        DISCIO_DiscDataRemoveW, DISCIO_ProjectWriteImageW, DISCIO_ProjectWriteDisc, DISCIO_DriveBlankDisc);
    expectRefused(wrong, static_cast<const void*>(nullptr), DISCIO_DriveOpenDisc, DISCIO_DriveGetNameW,
                  DISCIO_DriveGetPathW, DISCIO_DriveGetRevisionW, DISCIO_DriveGetDriverDescriptionW,
                  DISCIO_DriveGetReadSpeedList, DISCIO_DiscAudioGetMetaDataStringW,
                  DISCIO_DiscAudioGetSegmentMetaDataStringW, DISCIO_DiscAudioCreatePCMAudioStreamFromSegment,
                  DISCIO_DiscDataGetTitleW, DISCIO_DiscDataCreateCursorW, DISCIO_DataCursorCreateSubCursor,
                  DISCIO_DataCursorGetNameW, DISCIO_DataCursorGetDiscPathW,
                  DISCIO_DataCursorGetFileSourceURIW, DISCIO_ProjectGetVirtualDisc);
    Discio<DISCIO_Project> project(DISCIO_CreateAudioCDProject(library.get()));
    expectRefused(project.get(), static_cast<const void*>(nullptr), DISCIO_CreateAudioCDProject,
                  DISCIO_CreateDataDiscProject, DISCIO_CreatePCMAudioStreamFromFuncs,
                  DISCIO_CreatePCMAudioStreamFromFileW);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_INVALID_PARAM);
    EXPECT_EQ(DISCIO_OpenDrive(library.get(), 0), nullptr); // not enumerated yet
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NO_SUCH_OBJECT);
    EXPECT_EQ(DISCIO_Release(nullptr), 0);
}
