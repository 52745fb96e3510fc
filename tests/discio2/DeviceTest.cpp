// Optical drives, with a faked one. The cases run in a process of their own under umockdev-wrapper.
#include "discio2/DiscSupport.h"
#include "discio2/FakeDrive.h"

using namespace tests;

namespace {

struct SOpenDrive {
    SOpenDrive() : library(DISCIO_Create()) {
        DISCIO_EnumerateDrives(library.get());
        drive.reset(DISCIO_OpenDrive(library.get(), 0));
        disc.reset(DISCIO_DriveOpenDisc(drive.get()));
    }
    Discio<DISCIO_Library> library;
    Discio<DISCIO_Drive> drive;
    Discio<DISCIO_Disc> disc;
};

// Reads a whole track; the text of the failure after what was read before it.
std::string readTrack(DISCIO_Disc* disc, int segment, int64_t& repairs) {
    const Discio<DISCIO_PCMAudioStream> stream(
        DISCIO_DiscAudioCreatePCMAudioStreamFromSegment(disc, segment));
    std::string pcm;
    const auto fail = [&] {
        return pcm + narrow(DISCIO_GetErrorMessageW(nullptr, DISCIO_GetLastError(nullptr)));
    };
    if (!stream || stream->funcs->open(stream->user) != 1) return fail();
    for (int32_t delivered = 1; delivered > 0;) {
        std::string block(4 * 588 * 10, '\0');
        if (stream->funcs->read(stream->user, block.data(), 588 * 10, &delivered) != 1) return fail();
        pcm.append(block, 0, 4 * static_cast<size_t>(delivered));
    }
    repairs = stream->funcs->getRepairs(stream->user);
    return pcm;
}

} // namespace

// Run by the test below.
TEST(DISABLED_Device, Cases) {
    const CFakeDrive fake;
    fakeDisc().starts = {0, 100, 200};
    fakeDisc().samples = makeSectors(200, 3);
    const SOpenDrive open;
    ASSERT_EQ(DISCIO_GetDriveCount(open.library.get()), 1);
    EXPECT_EQ(narrow(DISCIO_DriveGetPathW(open.drive.get())), "/dev/sr0");
    EXPECT_EQ(narrow(DISCIO_DriveGetNameW(open.drive.get())), "ACME Disc reader");
    EXPECT_EQ(narrow(DISCIO_DriveGetRevisionW(open.drive.get())), "1.00");
    EXPECT_EQ(DISCIO_DriveCheckDisc(open.drive.get(), 0, 0), 1);
    ASSERT_TRUE(open.disc) << narrow(DISCIO_GetErrorMessageW(nullptr, DISCIO_GetLastError(nullptr)));
    EXPECT_EQ(DISCIO_DiscGetMediumType(open.disc.get()), 1);
    EXPECT_EQ(DISCIO_DiscGetTrackCount(open.disc.get()), 2);
    EXPECT_EQ(DISCIO_DiscGetTrackStartBlocks(open.disc.get(), 1), 100);
    EXPECT_EQ(DISCIO_DiscGetTrackLengthBlocks(open.disc.get(), 1), 100);
    int64_t repairs = -1;
    for (int i = 0; i < 2; ++i)
        EXPECT_TRUE(
            readTrack(open.disc.get(), i, repairs) ==
            fakeDisc().samples.substr(100 * kSectorBytes * static_cast<size_t>(i), 100 * kSectorBytes))
            << i;
    EXPECT_EQ(repairs, 0);
    // Reads that begin at the wrong place are noticed and repeated.
    fakeDisc().shakyReads = 3;
    EXPECT_TRUE(readTrack(open.disc.get(), 1, repairs) == fakeDisc().samples.substr(100 * kSectorBytes));
    EXPECT_EQ(fakeDisc().shakyReads, 0);
    // A place that cannot be read, and another disc.
    fakeDisc().badBlock = 50;
    const std::string partial = readTrack(open.disc.get(), 0, repairs);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DEVICE) << partial.substr(partial.size() - 100);
    fakeDisc().badBlock = -1;
    fakeDisc().starts = {0, 120, 200};
    readTrack(open.disc.get(), 0, repairs);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_LOST);
    fakeDisc().isBlank = true;
    const SOpenDrive blank;
    ASSERT_TRUE(blank.disc);
    EXPECT_EQ(DISCIO_DiscIsEmpty(blank.disc.get()), 1);
    EXPECT_EQ(DISCIO_DiscGetMediumType(blank.disc.get()), 2);
    fakeDisc().isPresent = false;
    EXPECT_EQ(DISCIO_DriveCheckDisc(open.drive.get(), 0, 0), 0);
    EXPECT_FALSE(SOpenDrive().disc);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NO_DISC);
}

TEST(Device, AFakedDriveIsReadLikeARealOne) {
    const std::string self = std::filesystem::read_symlink("/proc/self/exe");
    const SProcessResult result =
        run({"env", "ASAN_OPTIONS=verify_asan_link_order=0", "timeout", "60", "umockdev-wrapper", self,
             "--gtest_filter=DISABLED_Device.*", "--gtest_also_run_disabled_tests", "--gtest_brief=1"});
    EXPECT_EQ(result.exitCode, 0) << result.out << result.err;
}
