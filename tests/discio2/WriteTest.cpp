#include "discio2/ProjectSupport.h"

#include <cerrno>
#include <cmath>
#include <csignal>
#include <set>
#include <sys/resource.h>
#include <sys/syscall.h>

using namespace tests;

namespace {

bool s_canExchange = true;

std::set<std::string> listFolder(const CTempFolder& folder) {
    std::set<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(folder.path()))
        names.insert(entry.path().filename());
    return names;
}

} // namespace

// Instead of the system's: not every file system can exchange two files.
extern "C" __attribute__((visibility("default"))) int
renameat2(int fromFolder, const char* from, int toFolder, const char* to, unsigned flags) noexcept {
    if (s_canExchange)
        return static_cast<int>(::syscall(SYS_renameat2, fromFolder, from, toFolder, to, flags));
    errno = EINVAL;
    return -1;
}

TEST(Write, OtherProgramsReadTheCueSheet) {
    const CTempFolder folder;
    SSource a(makeSectors(310, 1)), b(makeSectors(301, 2).substr(0, 4 * (588 * 300 + 7)));
    const SProject own(true);
    ASSERT_EQ(own.insert(a), 1);
    ASSERT_EQ(own.insert(b), 1);
    DISCIO_Disc* const disc = own.disc.get();
    DISCIO_DiscAudioSetMetaDataStringW(disc, DISCIO_TEXT_TITLE, u"Caf\u00E9 \"live\"");
    DISCIO_DiscAudioSetMetaDataStringW(disc, DISCIO_TEXT_CODE, u"1234567890123");
    DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 1, DISCIO_TEXT_PERFORMER, u"Band");
    DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 1, DISCIO_TEXT_CODE, u"DEXXX0100001");
    folder.write("disc.cue", "old");
    ASSERT_EQ(own.write(folder / "disc.cue"), 1) << lastError();
    EXPECT_EQ(listFolder(folder), (std::set<std::string>{"disc.bin", "disc.cdt", "disc.cue"}));
    EXPECT_TRUE(readFile(folder / "disc.bin") ==
                a.pcm + std::string(150 * kSectorBytes, '\0') + b.pcm + std::string(4 * (588 - 7), '\0'));
    const SOpenDisc image(folder / "disc.cue");
    EXPECT_EQ(image.describe(), "0+310-150 460+301-150 | 761");
    EXPECT_TRUE(image.readSegment(0) == a.pcm);
    for (const int32_t text : {DISCIO_TEXT_TITLE, DISCIO_TEXT_PERFORMER, DISCIO_TEXT_CODE})
        for (const int segment : {-1, 0, 1})
            EXPECT_EQ(getText(image.disc, segment, text), getText(own.disc, segment, text)) << segment;
    const SProcessResult peer = run({"cdrdao", "show-toc", "--force", "disc.cue"}, folder.path());
    ASSERT_EQ(peer.exitCode, 0) << peer.err;
    for (const char* line : {"START  00:00:00(     0)", "END    00:04:10(   310)", "PREGAP 00:02:00(   150)",
                             "START  00:06:10(   460)", "END    00:10:11(   761)"})
        EXPECT_NE(peer.out.find(line), std::string::npos) << line << "\n" << peer.out;
    const SProcessResult info = run({"cd-info", "--no-cddb", "--no-device-info", "disc.cue"}, folder.path());
    ASSERT_EQ(info.exitCode, 0) << info.err;
    for (const char* line : {"1: 00:02:00  000000 audio", "2: 00:08:10  000460 audio", "000761 leadout",
                             "(MCN): 1234567890123", "PERFORMER: Band"})
        EXPECT_NE(info.out.find(line), std::string::npos) << line << "\n" << info.out;
    // Texts beyond Latin-1 are in the sheet only.
    DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 0, DISCIO_TEXT_TITLE, u"\u0416");
    ASSERT_EQ(own.write(folder / "other.cue"), 1) << lastError();
    EXPECT_FALSE(std::filesystem::exists(folder / "other.cdt"));
    EXPECT_EQ(getText(SOpenDisc(folder / "other.cue").disc, 0), u"\u0416");
}

// Whatever ends a write, the files that were there are unchanged and there are no others.
TEST(Write, AFailureLeavesNothing) {
    const CTempFolder folder;
    folder.write("disc.cue", "old sheet");
    folder.write("disc.bin", "old samples");
    folder.write("data.iso", "old data");
    folder.write("source", std::string(300 << 10, 'x'));
    const auto before = listFolder(folder);
    SSource source(makeSectors(200, 1));
    const SProject audio(true), data(false), empty(true);
    ASSERT_EQ(audio.insert(source), 1);
    const std::u16string path = wide((folder / "source").string());
    ASSERT_EQ(DISCIO_DiscDataAddFileW(data.disc.get(), u"file", path.c_str()), 1);
    const auto expect = [&](const SProject& own, const std::string& name, int32_t code, const char* reason,
                            const DISCIO_WriteOptions* options = nullptr) {
        EXPECT_EQ(own.write(folder / name, options), 0) << reason;
        EXPECT_EQ(DISCIO_GetLastError(nullptr), code) << lastError();
        EXPECT_NE(lastError().find(reason), std::string::npos) << lastError();
        EXPECT_EQ(listFolder(folder), before);
        EXPECT_EQ(readFile(folder / "disc.cue") + readFile(folder / "disc.bin") +
                      readFile(folder / "data.iso"),
                  "old sheetold samplesold data");
    };
    const DISCIO_WriteOptions bad[] = {{sizeof bad[0] - 1, 0, 0, nullptr, nullptr},
                                       {sizeof bad[0], 16, 0, nullptr, nullptr},
                                       {sizeof bad[0], 0, -1, nullptr, nullptr},
                                       {sizeof bad[0], 0, NAN, nullptr, nullptr}};
    for (const DISCIO_WriteOptions& options : bad)
        expect(audio, "disc.cue", DISCIO_ERROR_INVALID_PARAM, "", &options);
    for (const uint32_t flag : {DISCIO_WRITE_DUMMY, DISCIO_WRITE_BLANK}) {
        const DISCIO_WriteOptions options{sizeof options, flag, 0, nullptr, nullptr};
        expect(audio, "disc.cue", DISCIO_ERROR_NOT_SUPPORTED, "neither a dummy nor blanked", &options);
    }
    expect(empty, "disc.cue", DISCIO_ERROR_DISC_EMPTY, "no tracks");
    expect(audio, "disc.iso", DISCIO_ERROR_UNSUPPORTED_FORMAT, ".cue");
    expect(audio, "none/disc.cue", DISCIO_ERROR_CANNOT_WRITE, "none/disc.cue: No such file");
    source.failsAt = 60000;
    expect(audio, "disc.cue", DISCIO_ERROR_READ_INPUT, "track 1: the source cannot be read at frame");
    source.failsAt = -1;
    // Cancelled in every phase; the project is protected while it is written.
    struct SCancel {
        int32_t phase;
        const SProject* own;
    };
    for (const int32_t phase :
         {DISCIO_PHASE_PREPARE, DISCIO_PHASE_WRITE, DISCIO_PHASE_FINISH, DISCIO_PHASE_VERIFY})
        for (const SProject* own : {&audio, &data}) {
            SCancel cancel{phase, own};
            DISCIO_WriteOptions options{sizeof options, 0, 0, nullptr, &cancel};
            options.onProgress = [](void* user, int32_t now, double fraction) {
                EXPECT_GE(fraction, 0);
                EXPECT_LE(fraction, 1);
                const auto& wanted = *static_cast<SCancel*>(user);
                DISCIO_Disc* const disc = wanted.own->disc.get();
                EXPECT_EQ(
                    DISCIO_DiscDataRemoveW(disc, u"file") + DISCIO_DiscDataSetTitleW(disc, u"x") +
                        DISCIO_DiscDataCreateFolderW(disc, u"x") + DISCIO_DiscAudioRemoveSegment(disc, 0) +
                        DISCIO_DiscAudioSetSegmentPregap(disc, 0, 150) +
                        DISCIO_DiscAudioSetMetaDataStringW(disc, 0, u"x") +
                        DISCIO_DiscAudioSetSegmentMetaDataStringW(disc, 0, 0, u"x") +
                        DISCIO_DiscDataAddFileW(disc, u"x", u"/etc/passwd") + wanted.own->write("/none/x"),
                    0);
                EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_CONTENTS_IN_USE);
                return int32_t{now != wanted.phase};
            };
            expect(*own, own == &audio ? "disc.cue" : "data.iso", DISCIO_ERROR_ABORTED, "cancelled",
                   &options);
        }
    // A full disk: files cannot grow beyond a limit.
    const auto handler = std::signal(SIGXFSZ, SIG_IGN);
    rlimit old{};
    getrlimit(RLIMIT_FSIZE, &old);
    for (const SProject* own : {&audio, &data}) {
        const rlimit small{100 << 10, old.rlim_max};
        setrlimit(RLIMIT_FSIZE, &small);
        const int32_t result = own->write(folder / (own == &audio ? "disc.cue" : "data.iso"));
        setrlimit(RLIMIT_FSIZE, &old);
        EXPECT_EQ(result, 0);
        EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NOT_ENOUGH_SPACE) << lastError();
        EXPECT_EQ(listFolder(folder), before);
    }
    std::signal(SIGXFSZ, handler);
    folder.write("source", "changed");
    expect(data, "data.iso", DISCIO_ERROR_READ_INPUT, "source has changed");
}

// A folder takes the place of the sheet after the samples have got theirs.
TEST(Write, AFileThatFindsNoPlaceTakesTheOthersBack) {
    for (const bool canExchange : {true, false}) {
        s_canExchange = canExchange;
        const CTempFolder folder;
        folder.write("disc.bin", "old samples");
        SSource source(makeSectors(3, 1));
        const SProject own(true);
        ASSERT_EQ(own.insert(source), 1);
        std::filesystem::path sheet = folder / "disc.cue";
        DISCIO_WriteOptions options{sizeof options, 0, 0, nullptr, &sheet};
        options.onProgress = [](void* user, int32_t phase, double) {
            if (phase == DISCIO_PHASE_VERIFY)
                std::filesystem::create_directory(*static_cast<std::filesystem::path*>(user));
            return int32_t{1};
        };
        EXPECT_EQ(own.write(sheet, &options), 0);
        EXPECT_NE(lastError().find("disc.cue: Is a directory"), std::string::npos) << lastError();
        EXPECT_EQ(readFile(folder / "disc.bin"), "old samples") << canExchange;
        std::filesystem::remove(sheet);
        EXPECT_EQ(own.write(sheet), 1) << lastError();
        EXPECT_TRUE(readFile(folder / "disc.bin") == source.pcm);
        EXPECT_EQ(listFolder(folder), (std::set<std::string>{"disc.bin", "disc.cue"}));
    }
    s_canExchange = true;
}

// Other programs list the file system and check its contents.
TEST(Write, ADataProjectBecomesAFileSystem) {
    const CTempFolder folder;
    const std::string content = makeSectors(3, 5);
    const std::u16string source = wide(folder.write("source", content).string());
    const SProject own(false);
    DISCIO_Disc* const disc = own.disc.get();
    const std::u16string name = u"Pi\u00F1a \u0416 " + std::u16string(80, u'n') + u".text";
    ASSERT_EQ(DISCIO_DiscDataSetTitleW(disc, u"My disc"), 1);
    std::u16string deep;
    for (int i = 0; i < 10; ++i) {
        deep += u"\\Folder";
        ASSERT_EQ(DISCIO_DiscDataCreateFolderW(disc, deep.c_str()), 1) << lastError();
    }
    ASSERT_EQ(DISCIO_DiscDataAddFileW(disc, (deep + u"\\" + name).c_str(), source.c_str()), 1) << lastError();
    ASSERT_EQ(DISCIO_DiscDataAddFileW(disc, u"\U0001F3B5", source.c_str()), 1); // not in Joliet
    ASSERT_EQ(DISCIO_DiscDataCreateFolderW(disc, u"many"), 1);
    constexpr int kFiles = 10000;
    const std::u16string nothing = wide(folder.write("empty", "").string());
    for (int i = 0; i < kFiles; ++i)
        ASSERT_EQ(DISCIO_DiscDataAddFileW(disc, wide("many/file " + std::to_string(i) + ".txt").c_str(),
                                          (i % 1000 == 0 ? source : nothing).c_str()),
                  1);
    ASSERT_EQ(own.write(folder / "disc.iso"), 1) << lastError();
    const SProcessResult rockRidge =
        run({"xorriso", "-osirrox", "on", "-indev", "disc.iso", "-pvd_info", "-find", "/", "-type", "f",
             "-exec", "echo", "--", "-extract", "/many/file 9000.txt", "out.txt"},
            folder.path());
    ASSERT_EQ(rockRidge.exitCode, 0) << rockRidge.err;
    EXPECT_EQ(std::count(rockRidge.out.begin(), rockRidge.out.end(), '\n') >= kFiles + 1, true);
    EXPECT_NE((rockRidge.out + rockRidge.err).find("My disc"), std::string::npos);
    EXPECT_NE(rockRidge.out.find("Pi\u00F1a \u0416 nnn"), std::string::npos);
    EXPECT_NE(rockRidge.out.find("/\U0001F3B5"), std::string::npos);
    EXPECT_TRUE(readFile(folder / "out.txt") == content);
    const SProcessResult joliet =
        run({"7z", "l", "-slt", "disc.iso"}, folder.path(), {{"LC_ALL", "C.UTF-8"}});
    ASSERT_EQ(joliet.exitCode, 0) << joliet.out;
    EXPECT_NE(joliet.out.find("Path = many/file 9999.txt"), std::string::npos);
    const SOpenDisc image(folder / "disc.iso");
    EXPECT_EQ(narrow(DISCIO_DiscDataGetTitleW(image.disc.get())), "My disc");
    const Discio<DISCIO_DataCursor> cursor(DISCIO_DiscDataCreateCursorW(image.disc.get(), deep.c_str()));
    ASSERT_EQ(DISCIO_DataCursorNext(cursor.get()), 1) << lastError();
    EXPECT_EQ(std::u16string(DISCIO_DataCursorGetNameW(cursor.get())), name);
    EXPECT_EQ(DISCIO_DataCursorGetSize(cursor.get()), static_cast<int64_t>(content.size()));
}
