#include "discio2/DiscSupport.h"
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
}

TEST(Drive, BadHandlesAreRefused) {
    const Discio<DISCIO_Library> library(DISCIO_Create());
    EXPECT_EQ(DISCIO_CreateEx(99, nullptr), nullptr);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_UNSUPPORTED_API_VERSION);
    void* const wrong = library.get();
    EXPECT_EQ(DISCIO_DriveGetNameW(static_cast<DISCIO_Drive*>(wrong)), nullptr);
    EXPECT_EQ(DISCIO_DiscGetTrackCount(static_cast<DISCIO_Disc*>(wrong)), -1);
    EXPECT_EQ(DISCIO_DataCursorNext(nullptr), 0);
    EXPECT_EQ(DISCIO_DataCursorGetNameW(nullptr), nullptr);
    EXPECT_EQ(DISCIO_OpenDrive(library.get(), 0), nullptr); // not enumerated yet
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NO_SUCH_OBJECT);
    EXPECT_EQ(DISCIO_Release(nullptr), 0);
}
