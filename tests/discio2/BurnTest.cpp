// Writing with a faked drive. The cases run in processes of their own under umockdev-wrapper.
#include "discio2/FakeBurner.h"
#include "discio2/ProjectSupport.h"

using namespace tests;

namespace {

struct SDrive {
    SDrive() : library(DISCIO_Create()) {
        DISCIO_EnumerateDrives(library.get());
        drive.reset(DISCIO_OpenDrive(library.get(), 0));
    }
    CFakeBurner fake;
    Discio<DISCIO_Library> library;
    Discio<DISCIO_Drive> drive;
};

struct SPhases {
    std::string seen;
    int32_t cancelAt = -1;
    static int32_t onProgress(void* user, int32_t phase, double fraction) {
        auto& own = *static_cast<SPhases*>(user);
        const char letter = static_cast<char>('0' + phase);
        if (own.seen.empty() || own.seen.back() != letter) own.seen += letter;
        return phase != own.cancelAt || fraction == 0;
    }
};

} // namespace

// Run by the tests below.
TEST(DISABLED_Burn, Audio) {
    const SDrive own;
    const SProject project(true);
    SSource a(makeSectors(310, 1)), b(makeSectors(320, 2).substr(0, 4 * (588 * 319 + 5)));
    ASSERT_EQ(project.insert(a), 1);
    ASSERT_EQ(project.insert(b), 1);
    DISCIO_Disc* const disc = project.disc.get();
    DISCIO_DiscAudioSetMetaDataStringW(disc, DISCIO_TEXT_TITLE, u"Caf\u00E9");
    DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 1, DISCIO_TEXT_TITLE, u"Second");
    DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 1, DISCIO_TEXT_CODE, u"DEXXX0100001");
    SPhases phases;
    const DISCIO_WriteOptions options{sizeof options, DISCIO_WRITE_VERIFY | DISCIO_WRITE_CD_TEXT, 8,
                                      SPhases::onProgress, &phases};
    ASSERT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), own.drive.get(), &options), 1)
        << lastError() << " refused: " << fakeBurner().unknown;
    EXPECT_EQ(phases.seen, "0234");
    EXPECT_EQ(fakeDisc().starts, (std::vector<int>{0, 460, 780}));
    EXPECT_TRUE(fakeDisc().samples ==
                a.pcm + std::string(150 * kSectorBytes, '\0') + b.pcm + std::string(4 * 583, '\0'));
    const Discio<DISCIO_Disc> written(DISCIO_DriveOpenDisc(own.drive.get()));
    EXPECT_EQ(std::u16string(DISCIO_DiscAudioGetMetaDataStringW(written.get(), DISCIO_TEXT_TITLE)),
              u"Caf\u00E9");
    EXPECT_EQ(narrow(DISCIO_DiscAudioGetSegmentMetaDataStringW(written.get(), 0, DISCIO_TEXT_TITLE)), "");
    EXPECT_EQ(narrow(DISCIO_DiscAudioGetSegmentMetaDataStringW(written.get(), 1, DISCIO_TEXT_TITLE)),
              "Second");
    // A disc that is not empty is not written again.
    EXPECT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), own.drive.get(), &options), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_NOT_WRITABLE) << lastError();
}

TEST(DISABLED_Burn, Data) {
    const CTempFolder folder;
    const SDrive own;
    const SProject project(false);
    const std::string content = makeSectors(100, 1);
    const std::u16string source = wide(folder.write("source", content).string());
    ASSERT_EQ(DISCIO_DiscDataSetTitleW(project.disc.get(), u"My disc"), 1);
    ASSERT_EQ(DISCIO_DiscDataAddFileW(project.disc.get(), u"file", source.c_str()), 1);
    DISCIO_WriteOptions options{sizeof options, DISCIO_WRITE_DUMMY, 0, nullptr, nullptr};
    ASSERT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), own.drive.get(), &options), 1)
        << lastError() << " refused: " << fakeBurner().unknown;
    EXPECT_TRUE(fakeDisc().isBlank);
    ASSERT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), own.drive.get(), nullptr), 1) << lastError();
    const SOpenDisc image(folder.write("disc.iso", fakeDisc().samples));
    EXPECT_EQ(narrow(DISCIO_DiscDataGetTitleW(image.disc.get())), "My disc");
    EXPECT_NE(fakeDisc().samples.find(content), std::string::npos);
    EXPECT_EQ(DISCIO_DriveBlankDisc(own.drive.get(), 0, nullptr), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_NOT_ERASABLE) << lastError();
}

TEST(DISABLED_Burn, Failures) {
    const SDrive own;
    fakeBurner().isRewritable = true;
    const SProject project(true);
    SSource source(makeSectors(310, 1)), brief(makeSectors(1, 1)), endless(makeSectors(1, 1));
    endless.frames = 85 * 60 * 44100;
    const auto expect = [&](int32_t code, uint32_t flags, SPhases* phases) {
        const DISCIO_WriteOptions options{sizeof options, flags, 0, phases ? SPhases::onProgress : nullptr,
                                          phases};
        EXPECT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), own.drive.get(), &options), code == 0);
        EXPECT_TRUE(code == 0 || DISCIO_GetLastError(nullptr) == code) << code << ": " << lastError();
    };
    expect(DISCIO_ERROR_DISC_EMPTY, 0, nullptr);
    for (const auto& [bad, code] : {std::pair{&brief, DISCIO_ERROR_NOT_SUPPORTED},
                                    std::pair{&endless, DISCIO_ERROR_NOT_ENOUGH_SPACE}}) {
        ASSERT_EQ(project.insert(*bad), 1) << lastError();
        expect(code, 0, nullptr);
        ASSERT_EQ(DISCIO_DiscAudioRemoveSegment(project.disc.get(), 0), 1);
    }
    EXPECT_TRUE(fakeBurner().blocks.empty());
    ASSERT_EQ(project.insert(source), 1);
    source.failsAt = 90000;
    expect(DISCIO_ERROR_READ_INPUT, 0, nullptr);
    source.failsAt = -1;
    fakeDisc().isBlank = true;
    SPhases cancelled;
    cancelled.cancelAt = DISCIO_PHASE_WRITE;
    expect(DISCIO_ERROR_ABORTED, 0, &cancelled);
    fakeDisc().isBlank = true;
    fakeBurner().failsAt = 200;
    expect(DISCIO_ERROR_DEVICE, 0, nullptr);
    fakeBurner().failsAt = INT32_MIN;
    fakeDisc().isBlank = false;
    expect(DISCIO_ERROR_DISC_NOT_EMPTY, 0, nullptr);
    expect(0, DISCIO_WRITE_BLANK, nullptr);
    EXPECT_TRUE(fakeBurner().wasBlanked);
    EXPECT_EQ(DISCIO_DriveBlankDisc(own.drive.get(), 0, nullptr), 1) << lastError();
    EXPECT_TRUE(fakeDisc().isBlank);
    fakeDisc().isPresent = false;
    fakeBurner().isRewritable = false;
    const SOpenDisc image("/nowhere.iso");
    EXPECT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), image.drive.get(), nullptr), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NOT_SUPPORTED);
}

// At the same time, since the library waits for its drive most of the time.
TEST(Burn, AFakedDriveHoldsWhatWasWritten) {
    const std::string self = std::filesystem::read_symlink("/proc/self/exe");
    std::vector<std::unique_ptr<CProcess>> processes;
    for (const char* name : {"Audio", "Data", "Failures"})
        processes.push_back(std::make_unique<CProcess>(std::vector<std::string>{
            "env", "ASAN_OPTIONS=verify_asan_link_order=0", "timeout", "240", "umockdev-wrapper", self,
            std::string("--gtest_filter=DISABLED_Burn.") + name, "--gtest_also_run_disabled_tests",
            "--gtest_brief=1"}));
    for (const auto& process : processes) {
        const SProcessResult result = process->wait();
        EXPECT_EQ(result.exitCode, 0) << result.out << result.err;
    }
}
