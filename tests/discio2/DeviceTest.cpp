// Optical drives, with a faked one. The cases run in a process of their own under umockdev-wrapper.
#include "discio2/DiscSupport.h"
#include "discio2/FakeDrive.h"

using namespace tests;

// Run by the last test.
TEST(DISABLED_Device, Cases) {
    const CFakeDrive fake;
    fakeDisc() = {};
    fakeDisc().starts = {0, 100, 200};
    fakeDisc().samples = makeSectors(200, 3);
    const SOpenDisc open;
    ASSERT_EQ(DISCIO_GetDriveCount(open.library.get()), 1);
    EXPECT_EQ(narrow(DISCIO_DriveGetPathW(open.drive.get())), "/dev/sr0");
    EXPECT_EQ(narrow(DISCIO_DriveGetNameW(open.drive.get())), "ACME Disc reader");
    EXPECT_EQ(narrow(DISCIO_DriveGetRevisionW(open.drive.get())), "1.00");
    EXPECT_EQ(narrow(DISCIO_DriveGetDriverDescriptionW(open.drive.get())), "optical drive");
    EXPECT_EQ(DISCIO_DriveCheckDisc(open.drive.get(), 0, 0), 1);
    for (const auto& [times, milliseconds, result] :
         {std::tuple(2, 30000, 1), {1, 0, 0}, {1 << 20, 100, 0}}) {
        fakeDisc().notReady = times;
        EXPECT_EQ(DISCIO_DriveCheckDisc(open.drive.get(), milliseconds, 0), result);
    }
    fakeDisc().notReady = 0;
    for (const auto& [error, code] : {std::pair{0, 0},
                                      {ENOSYS, DISCIO_ERROR_NOT_SUPPORTED},
                                      {EOPNOTSUPP, DISCIO_ERROR_NOT_SUPPORTED},
                                      {EIO, DISCIO_ERROR_DEVICE}}) {
        fakeDisc().trayError = error;
        EXPECT_EQ(DISCIO_DriveOpenTray(open.drive.get()) + DISCIO_DriveCloseTray(open.drive.get()),
                  error ? 0 : 2);
        EXPECT_TRUE(error == 0 || DISCIO_GetLastError(nullptr) == code) << lastError();
    }
    EXPECT_EQ(fakeDisc().trayMoves, "ococococ");
    ASSERT_TRUE(open.disc) << lastError();
    EXPECT_EQ(DISCIO_DiscGetMediumType(open.disc.get()), 1);
    EXPECT_EQ(DISCIO_DiscIsWritable(open.disc.get()) + DISCIO_DiscIsErasable(open.disc.get()), 0);
    EXPECT_EQ(DISCIO_DiscGetFreeSpaceFraction(open.disc.get()), 0.0);
    EXPECT_EQ(DISCIO_DiscGetCapacityBytes(open.disc.get()), 200 * 2048);
    EXPECT_EQ(DISCIO_DiscGetTrackCount(open.disc.get()), 2);
    EXPECT_EQ(DISCIO_DiscGetTrackStartBlocks(open.disc.get(), 1), 100);
    EXPECT_EQ(DISCIO_DiscGetTrackLengthBlocks(open.disc.get(), 1), 100);
    int64_t repairs = -1;
    for (int i = 0; i < 2; ++i)
        EXPECT_TRUE(
            open.readSegment(i, &repairs) ==
            fakeDisc().samples.substr(100 * kSectorBytes * static_cast<size_t>(i), 100 * kSectorBytes))
            << i;
    EXPECT_EQ(repairs, 0);
    // A place that cannot be read, and another disc.
    fakeDisc().badBlock = 50;
    const std::string partial = open.readSegment(0, &repairs);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DEVICE) << partial.substr(partial.size() - 100);
    fakeDisc().badBlock = -1;
    fakeDisc().starts = {0, 120, 200};
    open.readSegment(0, &repairs);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_LOST);
    fakeDisc().isBlank = true;
    const SOpenDisc blank;
    ASSERT_TRUE(blank.disc);
    EXPECT_EQ(DISCIO_DiscIsEmpty(blank.disc.get()), 1);
    EXPECT_EQ(DISCIO_DiscIsWritable(blank.disc.get()), 1);
    EXPECT_EQ(DISCIO_DiscGetFreeSpaceFraction(blank.disc.get()), 1.0);
    EXPECT_EQ(DISCIO_DiscGetCapacityBytes(blank.disc.get()), 359849LL * 2048);
    const std::pair<int, int> types[] = {{0x08, 1},  {0x09, 2},  {0x0A, 3},  {0x10, 4},  {0x11, 6},
                                         {0x12, 5},  {0x13, 7},  {0x14, 7},  {0x15, 11}, {0x16, 11},
                                         {0x1A, 9},  {0x1B, 8},  {0x2B, 10}, {0x40, 12}, {0x41, 13},
                                         {0x42, 13}, {0x43, 14}, {0x44, -1}};
    for (const auto& [profile, type] : types) {
        fakeDisc().profile = profile;
        EXPECT_EQ(DISCIO_DiscGetMediumType(SOpenDisc().disc.get()), type) << profile;
    }
    fakeDisc().isPresent = false;
    EXPECT_EQ(DISCIO_DriveCheckDisc(open.drive.get(), 0, 0), 0);
    EXPECT_FALSE(SOpenDisc().disc);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NO_DISC);
}

// 17 tracks with 20 to 36 blocks; the third has a pregap, and 0.5 seconds of sound precede the first.
TEST(DISABLED_Device, AnAudioDiscWithTextsPregapsAndAHiddenTrack) {
    const CFakeDrive fake;
    fakeDisc() = {};
    std::vector<std::string> titles{"The disc"};

    int start = 37;
    for (int i = 0; i < 17; ++i) {
        fakeDisc().starts.push_back(start);
        fakeDisc().pregaps.push_back(i == 0 ? 187 : i == 2 ? 13 : i == 9 ? 1 : 0);
        titles.push_back("Title number " + std::to_string(i + 1));
        start += 20 + i;
    }
    fakeDisc().starts.push_back(start);
    fakeDisc().samples = makeSectors(static_cast<size_t>(start), 9);
    fakeDisc().textPacks = makeTextPacks(titles);
    fakeDisc().code = "DEABC2600001";
    const SOpenDisc open;
    ASSERT_TRUE(open.disc);
    EXPECT_EQ(DISCIO_DiscAudioGetSegmentCount(open.disc.get()), 17);
    EXPECT_EQ(getText(open.disc, -1), wide(titles[0]));
    // One block is read for each track, and some more where there is a pregap.
    EXPECT_LT(fakeDisc().subchannelReads, 60);
    for (int i = 0; i < 17; ++i) {
        const auto at = static_cast<size_t>(i);
        EXPECT_EQ(getText(open.disc, i), wide(titles[at + 1]));
        EXPECT_EQ(getText(open.disc, i, DISCIO_TEXT_CODE), u"DEABC2600001");
        EXPECT_EQ(DISCIO_DiscGetTrackPregap(open.disc.get(), i), fakeDisc().pregaps[at]) << i;
        const int next = i < 16 ? fakeDisc().pregaps[at + 1] : 0;
        EXPECT_EQ(DISCIO_DiscGetTrackLengthBlocks(open.disc.get(), i), 20 + i - next) << i;
    }
}

// A track of data before the audio, and one of a second session behind it.
TEST(DISABLED_Device, MixedDiscsAndDataDiscs) {
    const CTempFolder folder;
    folder.write("some file", "12345");
    CFakeDrive fake;
    struct SCase {
        std::vector<int> starts;
        size_t dataTrack;
        int sessionStart;
        std::vector<int> lengths;
    };
    for (const SCase& each :
         {SCase{{0, 400, 450}, 0, 0, {400, 50}}, SCase{{0, 100, 11600, 11900}, 2, 11600, {100, 100, 300}},
          SCase{{0, 400}, 0, 0, {400}}}) {
        fakeDisc() = {};
        fakeDisc().starts = each.starts;
        fakeDisc().dataTracks = {each.dataTrack};
        fakeDisc().sessionStart = each.sessionStart;
        fakeDisc().samples = makeSectors(static_cast<size_t>(each.starts.back()), 4);
        const int dataStart = each.starts[each.dataTrack];
        ASSERT_EQ(run({"genisoimage", "-quiet", "-J", "-C", "0," + std::to_string(dataStart), "-o",
                       "disc.iso", "some file"},
                      folder.path())
                      .exitCode,
                  0);
        fake.setData(readFile(folder / "disc.iso"), dataStart);
        const SOpenDisc open;
        ASSERT_TRUE(open.disc);
        int64_t repairs = 0;
        int segment = 0;
        for (size_t i = 0; i < each.lengths.size(); ++i) {
            const int index = static_cast<int>(i);
            EXPECT_EQ(DISCIO_DiscGetTrackLengthBlocks(open.disc.get(), index), each.lengths[i]);
            EXPECT_EQ(DISCIO_DiscGetComponentType(open.disc.get(), index), i == each.dataTrack ? 2 : 1);
            if (i == each.dataTrack) continue;
            EXPECT_TRUE(open.readSegment(segment++, &repairs) ==
                        fakeDisc().samples.substr(static_cast<size_t>(each.starts[i]) * kSectorBytes,
                                                  static_cast<size_t>(each.lengths[i]) * kSectorBytes));
        }
        const Discio<DISCIO_DataCursor> cursor(DISCIO_DiscDataCreateCursorW(open.disc.get(), u""));
        ASSERT_TRUE(cursor) << lastError();
        ASSERT_EQ(DISCIO_DataCursorNext(cursor.get()), 1);
        EXPECT_EQ(narrow(DISCIO_DataCursorGetNameW(cursor.get())), "some file");
        char bytes[10] = "";
        EXPECT_EQ(DISCIO_DataCursorRead(cursor.get(), 0, bytes, 10), 5);
        EXPECT_STREQ(bytes, "12345");
    }
}

// Its first read is off as often as the others, and silence hides where a read belongs.
TEST(DISABLED_Device, SamplesAreExactFromAPoorDrive) {
    const CFakeDrive fake;
    fakeDisc() = {};
    fakeDisc().starts = {0, 150, 400, 450};
    fakeDisc().samples = makeSectors(450, 8);
    for (const size_t silent : {0u, 1u, 149u, 151u, 201u, 202u, 203u, 400u, 401u, 448u})
        std::fill_n(fakeDisc().samples.begin() + static_cast<std::ptrdiff_t>(silent * (kSectorBytes + 4)),
                    kSectorBytes, '\0');
    fakeDisc().failures = {{170, 2}, {250, 3}, {399, 1}};
    fakeDisc().jitter = 500;
    fakeDisc().readMicroseconds = 100;
    const SOpenDisc open;
    int64_t repairs = 0, all = 0;
    for (int i = 0; i < 9; ++i) {
        const auto at = static_cast<size_t>(i % 3);
        const auto start = static_cast<size_t>(fakeDisc().starts[at]);
        EXPECT_TRUE(open.readSegment(i % 3, &repairs) ==
                    fakeDisc().samples.substr(start * kSectorBytes,
                                              (static_cast<size_t>(fakeDisc().starts[at + 1]) - start) *
                                                  kSectorBytes))
            << i;
        all += repairs;
    }
    EXPECT_GT(all, 6);
    for (const auto& [block, times] : fakeDisc().failures) EXPECT_EQ(times, 0) << block;
    // The tray is opened.
    fakeDisc().readsUntilOpened = 3;
    const std::string partial = open.readSegment(1, &repairs);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_LOST);
    EXPECT_NE(partial.find("/dev/sr0 has been taken out"), std::string::npos);
}

TEST(Device, AFakedDriveIsReadLikeARealOne) {
    runWithFakeDrive({"Device.*"});
}
