// Writing with a faked drive. The cases run in processes of their own under umockdev-wrapper.
#include "discio2/FakeBurner.h"
#include "discio2/ProjectSupport.h"

using namespace tests;

namespace {

struct SDrive : CFakeBurner, SOpenDisc {};

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
    std::fill_n(a.pcm.begin(), 4 * (75 * 588 - 20), '\0'); // to the end of the portion that is compared first
    ASSERT_EQ(project.insert(a), 1);
    ASSERT_EQ(project.insert(b), 1);
    DISCIO_Disc* const disc = project.disc.get();
    DISCIO_DiscAudioSetMetaDataStringW(disc, DISCIO_TEXT_TITLE, u"Caf\u00E9");
    DISCIO_DiscAudioSetMetaDataStringW(disc, DISCIO_TEXT_CODE, u"0123456789012");
    DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 1, DISCIO_TEXT_TITLE, u"Second");
    DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 1, DISCIO_TEXT_COMPOSER, u"Nobody");
    DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 1, DISCIO_TEXT_CODE, u"DEXXX0100001");
    SPhases phases;
    const DISCIO_WriteOptions options{sizeof options, DISCIO_WRITE_VERIFY | DISCIO_WRITE_CD_TEXT, 8,
                                      SPhases::onProgress, &phases};
    ASSERT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), own.drive.get(), &options), 1)
        << lastError() << " refused: " << fakeBurner().unknown;
    EXPECT_EQ(phases.seen, "0234");
    EXPECT_EQ(fakeDisc().starts, (std::vector<int>{0, 460, 780}));
    std::string sheet;
    for (const char byte : fakeBurner().cueSheet)
        sheet += std::to_string(static_cast<unsigned char>(byte)) + " ";
    EXPECT_EQ(sheet, "2 0 1 2 3 4 5 6 2 7 8 9 0 1 2 0 1 0 0 65 0 0 0 0 1 1 0 0 0 0 0 0 1 1 1 0 0 0 2 0 "
                     "3 2 68 69 88 88 88 48 3 2 49 48 48 48 48 49 1 2 0 0 0 0 6 10 1 2 1 0 0 0 8 10 "
                     "1 170 1 1 0 0 12 30 ")
        << "catalogue number, lead-in, tracks, the second one with its code and pregap, and the lead-out";
    EXPECT_TRUE(fakeDisc().samples ==
                a.pcm + std::string(150 * kSectorBytes, '\0') + b.pcm + std::string(4 * 583, '\0'));
    const SOpenDisc written;
    EXPECT_EQ(getText(written.disc, -1), u"Caf\u00E9");
    EXPECT_EQ(getText(written.disc, 0), u"");
    EXPECT_EQ(getText(written.disc, 1), u"Second");
    EXPECT_EQ(getText(written.disc, 1, DISCIO_TEXT_COMPOSER), u"Nobody") << "of this track only";
    // A disc that is not empty is not written again.
    EXPECT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), own.drive.get(), &options), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_NOT_WRITABLE) << lastError();
    // Where the drive places the sound is the same everywhere, and not far off.
    fakeBurner().isRewritable = true;
    for (const auto& [offset, code] : {std::pair{100, 0}, {2000, DISCIO_ERROR_DEVICE}}) {
        fakeBurner().offset = offset;
        const DISCIO_WriteOptions again{sizeof again, DISCIO_WRITE_BLANK | DISCIO_WRITE_VERIFY, 0, nullptr,
                                        nullptr};
        EXPECT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), own.drive.get(), &again), code == 0)
            << lastError();
        EXPECT_TRUE(code == 0 || DISCIO_GetLastError(nullptr) == code) << lastError();
    }
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
    EXPECT_GE(fakeDisc().samples.size() - fakeDisc().samples.find_last_not_of('\0'), 150u * 2048)
        << "drives read ahead";
    EXPECT_EQ(DISCIO_DriveBlankDisc(own.drive.get(), 0, nullptr), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_NOT_ERASABLE) << lastError();
    // A medium that is overwritten in place: the library for drives takes it for blank.
    fakeBurner().profile = 0x1A;
    fakeBurner().blocks.clear();
    options.flags = 0;
    EXPECT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), own.drive.get(), &options), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_NOT_EMPTY) << lastError();
    EXPECT_EQ(DISCIO_DriveBlankDisc(own.drive.get(), 0, nullptr), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NOT_SUPPORTED) << lastError();
    EXPECT_TRUE(fakeBurner().blocks.empty());
    const SProject audio(true);
    SSource sound(makeSectors(310, 1));
    ASSERT_EQ(audio.insert(sound), 1);
    EXPECT_EQ(DISCIO_ProjectWriteDisc(audio.project.get(), own.drive.get(), &options), 0);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_UNSUPPORTED_DISC_TYPE) << lastError();
    options.flags = DISCIO_WRITE_BLANK;
    EXPECT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), own.drive.get(), &options), 1)
        << lastError() << " refused: " << fakeBurner().unknown;
    EXPECT_FALSE(fakeBurner().blocks.empty());
}

TEST(DISABLED_Burn, Failures) {
    const SDrive own;
    fakeBurner().isRewritable = true;
    const SProject project(true);
    SSource source(makeSectors(310, 1)), brief(makeSectors(1, 1)), endless(makeSectors(1, 1));
    endless.frames = 85 * 60 * 44100;
    const auto expect = [&](int32_t code, uint32_t flags, SPhases* phases, bool isSpoilt = false) {
        const DISCIO_WriteOptions options{sizeof options, flags, 0, phases ? SPhases::onProgress : nullptr,
                                          phases};
        EXPECT_EQ(DISCIO_ProjectWriteDisc(project.project.get(), own.drive.get(), &options), code == 0);
        if (code == 0) return;
        EXPECT_EQ(DISCIO_GetLastError(nullptr), code) << lastError();
        EXPECT_EQ(lastError().ends_with("; the medium is partly written)"), isSpoilt) << lastError();
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
    expect(DISCIO_ERROR_READ_INPUT, 0, nullptr, true);
    source.failsAt = -1;
    fakeDisc().isBlank = true;
    SPhases cancelled;
    cancelled.cancelAt = DISCIO_PHASE_WRITE;
    expect(DISCIO_ERROR_ABORTED, DISCIO_WRITE_DUMMY, &cancelled);
    expect(DISCIO_ERROR_ABORTED, 0, &cancelled, true);
    fakeDisc().isBlank = true;
    fakeBurner().failsAt = 200;
    expect(DISCIO_ERROR_DEVICE, 0, nullptr, true);
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

TEST(Burn, AFakedDriveHoldsWhatWasWritten) {
    runWithFakeDrive({"Burn.Audio", "Burn.Data", "Burn.Failures"});
}
