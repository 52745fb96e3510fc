#include "discio2/DiscSupport.h"

using namespace tests;

namespace {

// All entries below a cursor, with "\" behind folders.
std::vector<std::string> listAll(DISCIO_DataCursor* cursor) {
    std::vector<std::string> found;
    while (DISCIO_DataCursorNext(cursor) == 1) {
        std::string path = narrow(DISCIO_DataCursorGetDiscPathW(cursor));
        if (DISCIO_DataCursorIsFolder(cursor) == 1) {
            found.push_back(path + "\\");
            const Discio<DISCIO_DataCursor> sub(DISCIO_DataCursorCreateSubCursor(cursor));
            for (const std::string& each : listAll(sub.get())) found.push_back(each);
        } else {
            found.push_back(path + " " + std::to_string(DISCIO_DataCursorGetSize(cursor)));
        }
    }
    std::sort(found.begin(), found.end());
    return found;
}

} // namespace

// Other programs write the file systems.
TEST(Data, FilesAreListedInEveryFileSystem) {
    const CTempFolder folder;
    std::filesystem::create_directories(folder / "in/Sub folder/deep");
    folder.write("in/a rather long name.text", "12345");
    ASSERT_EQ(run({"touch", "-d", "@1000000000", "in/a rather long name.text"}, folder.path()).exitCode, 0);
    folder.write("in/Sub folder/deep/x.bin", std::string(5000, 'x'));
    const std::vector<std::string> expected{"\\Sub folder\\", "\\Sub folder\\deep\\",
                                            "\\Sub folder\\deep\\x.bin 5000", "\\a rather long name.text 5"};
    for (const std::vector<std::string>& options :
         {std::vector<std::string>{"-J"}, {"-R"}, {"-J", "-R"}, {"-udf", "-R"}}) {
        std::vector<std::string> command{"env", "TZ=XXX-5:30", "genisoimage", "-quiet",
                                         "-V",  "My disc",     "-o",          "disc.iso"};
        command.insert(command.end(), options.begin(), options.end());
        command.push_back("in");
        ASSERT_EQ(run(command, folder.path()).exitCode, 0);
        const SOpenDisc open(folder / "disc.iso");
        ASSERT_TRUE(open.disc) << open.getError();
        EXPECT_EQ(DISCIO_DiscHasDataComponent(open.disc.get()), 1);
        EXPECT_EQ(DISCIO_DiscHasAudioComponent(open.disc.get()), 0);
        EXPECT_EQ(narrow(DISCIO_DiscDataGetTitleW(open.disc.get())), "My disc");
        const Discio<DISCIO_DataCursor> cursor(DISCIO_DiscDataCreateCursorW(open.disc.get(), u"\\"));
        ASSERT_TRUE(cursor) << open.getError();
        EXPECT_EQ(listAll(cursor.get()), expected) << options[0];
        EXPECT_EQ(DISCIO_DataCursorReset(cursor.get()), 1);
        while (DISCIO_DataCursorNext(cursor.get()) == 1) {
            const bool isFile = DISCIO_DataCursorIsFile(cursor.get()) == 1;
            EXPECT_EQ(isFile, narrow(DISCIO_DataCursorGetNameW(cursor.get())) == "a rather long name.text");
            EXPECT_EQ(DISCIO_DataCursorGetLastModifiedTime(cursor.get()) == 1'000'000'000, isFile)
                << options[0] << DISCIO_DataCursorGetLastModifiedTime(cursor.get());
        }
        const auto blocks = static_cast<int64_t>(std::filesystem::file_size(folder / "disc.iso")) / 2048;
        EXPECT_EQ(DISCIO_DiscGetCapacityBytes(open.disc.get()), blocks * 2048);
        EXPECT_EQ(DISCIO_DiscGetFreeSpaceFraction(open.disc.get()), 0.0);
        EXPECT_EQ(DISCIO_DiscIsWritable(open.disc.get()) + DISCIO_DiscIsErasable(open.disc.get()), 0);
        EXPECT_EQ(DISCIO_DiscDataFolderExistsW(open.disc.get(), u"Sub folder\\deep\\"), 1);
        EXPECT_EQ(DISCIO_DiscDataFolderExistsW(open.disc.get(), u"Sub folder\\none"), 0);
        EXPECT_EQ(DISCIO_DiscDataFolderExistsW(open.disc.get(), u"a rather long name.text"), 0);
        EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NOT_A_FOLDER);
    }
}

// In small and large parts, at random places.
TEST(Data, FilesAreReadFromEveryFileSystem) {
    const CTempFolder folder;
    std::filesystem::create_directories(folder / "in/sub");
    const std::string large = makeSectors(300, 6);
    for (const auto& [name, size] :
         {std::pair("empty", 0), {"one", 1}, {"block", 2048}, {"sub/large", 700001}})
        folder.write("in/" + std::string(name), large.substr(0, static_cast<size_t>(size)));
    for (const std::vector<std::string>& options :
         {std::vector<std::string>{"-J"}, {"-R"}, {"-udf", "-R"}, {"raw"}}) {
        const bool isRaw = options[0] == "raw";
        std::vector<std::string> command{"genisoimage", "-quiet", "-R", "-o", "disc.iso"};
        if (!isRaw) command.insert(command.end(), options.begin(), options.end());
        command.push_back("in");
        ASSERT_EQ(run(command, folder.path()).exitCode, 0);
        std::string image = "disc.iso";
        if (isRaw) {
            const std::string plain = readFile(folder / "disc.iso");
            std::string sectors;
            for (size_t i = 0; i < plain.size(); i += 2048)
                sectors += std::string(1, '\0') + std::string(10, '\xFF') + std::string(1, '\0') +
                           std::string(3, '\0') + "\1" + plain.substr(i, 2048) + std::string(288, '\0');
            folder.write("disc.bin", sectors);
            image = "disc.cue";
            folder.write(image, "FILE disc.bin BINARY\nTRACK 01 MODE1/2352\nINDEX 01 00:00:00\n");
        }
        // The library prefers ISO 9660: without its descriptors, only UDF is left.
        if (options[0] == "-udf") {
            std::string bytes = readFile(folder / image);
            bytes.replace(16 * 2048, 3 * 2048, std::string(3 * 2048, '\0'));
            folder.write(image, bytes);
        }
        const SOpenDisc open(folder / image);
        std::minstd_rand random(1);
        for (const char16_t* place : {u"", u"sub"}) {
            const Discio<DISCIO_DataCursor> cursor(DISCIO_DiscDataCreateCursorW(open.disc.get(), place));
            ASSERT_TRUE(cursor) << open.getError() << options[0];
            while (DISCIO_DataCursorNext(cursor.get()) == 1) {
                std::string bytes(800000, '\0');
                if (DISCIO_DataCursorIsFolder(cursor.get()) == 1) {
                    EXPECT_EQ(DISCIO_DataCursorRead(cursor.get(), 0, bytes.data(), 1), -1);
                    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NOT_A_FILE);
                    continue;
                }
                const int64_t size = DISCIO_DataCursorGetSize(cursor.get());
                ASSERT_EQ(DISCIO_DataCursorRead(cursor.get(), 0, bytes.data(), 800000), size)
                    << open.getError();
                EXPECT_EQ(bytes.compare(0, static_cast<size_t>(size), large, 0, static_cast<size_t>(size)),
                          0);
                for (int i = 0; i < 20; ++i) {
                    const int64_t offset = random() % (size + 1), wanted = random() % 5000;
                    const int64_t got = DISCIO_DataCursorRead(cursor.get(), offset, bytes.data(), wanted);
                    ASSERT_EQ(got, std::min(wanted, size - offset));
                    EXPECT_EQ(bytes.compare(0, static_cast<size_t>(got), large, static_cast<size_t>(offset),
                                            static_cast<size_t>(got)),
                              0);
                }
            }
        }
    }
}

TEST(Data, AMixedDiscHasBothComponents) {
    const CTempFolder folder;
    folder.write("file", "12345");
    ASSERT_EQ(run({"genisoimage", "-quiet", "-J", "-o", "data.iso", "file"}, folder.path()).exitCode, 0);
    const std::string audio = makeSectors(10, 7);
    folder.write("audio.bin", audio);
    const std::string iso = readFile(folder / "data.iso");
    const size_t blocks = iso.size() / 2048;
    std::string raw; // with sync pattern, address and mode in front, and check bytes behind
    for (size_t i = 0; i < blocks; ++i)
        raw += '\0' + std::string(10, '\xFF') + '\0' + big(i, 3) + '\1' + iso.substr(i * 2048, 2048) +
               std::string(288, '\0');
    folder.write("data.raw", raw);
    const std::string audioFile =
        "FILE audio.bin BINARY\nTRACK 02 AUDIO\nPREGAP 00:02:00\nINDEX 01 00:00:00\n";
    const std::pair<const char*, std::string> sheets[] = {
        {"mixed.cue", "FILE data.iso BINARY\nTRACK 01 MODE1/2048\nINDEX 01 00:00:00\n" + audioFile},
        {"raw.cue", "FILE data.raw BINARY\nTRACK 01 MODE1/2352\nINDEX 01 00:00:00\n" + audioFile},
        {"mixed.toc", "CD_ROM\nTRACK MODE1\nDATAFILE \"data.iso\"\nTRACK AUDIO\nPREGAP 00:02:00\n"
                      "FILE \"audio.bin\" SWAP 0\n"},
    };
    for (const auto& [name, sheet] : sheets) {
        SCOPED_TRACE(name);
        const SOpenDisc open(folder.write(name, sheet));
        ASSERT_TRUE(open.disc) << open.getError();
        EXPECT_EQ(open.describe(), "0+" + std::to_string(blocks) + "-150 " + std::to_string(blocks + 150) +
                                       "+10-150 | " + std::to_string(blocks + 160));
        EXPECT_EQ(DISCIO_DiscGetComponentCount(open.disc.get()), 2);
        EXPECT_EQ(DISCIO_DiscGetComponentType(open.disc.get(), 0), 2);
        EXPECT_EQ(DISCIO_DiscGetComponentType(open.disc.get(), 1), 1);
        EXPECT_TRUE(open.readSegment(0) == audio);
        const Discio<DISCIO_DataCursor> cursor(DISCIO_DiscDataCreateCursorW(open.disc.get(), u""));
        EXPECT_EQ(listAll(cursor.get()), std::vector<std::string>{"\\file 5"}) << open.getError();
    }
}

// Behind audio, in a session of its own or not, with addresses from the start of the disc or of the track.
TEST(Data, FilesBehindAudioAreRead) {
    const CTempFolder folder;
    std::filesystem::create_directories(folder / "in/Sub");
    const std::string content = makeSectors(3, 4);
    folder.write("in/Sub/Name of a file", content);
    folder.write("audio.bin", makeSectors(100, 5));
    const auto open = [&](const char* address, const char* naming, bool isRaw, int mode) {
        std::vector<std::string> command{"genisoimage", "-quiet", "-V", "My disc", naming, "-o", "disc.iso"};
        if (*address) command.insert(command.end(), {"-C", std::string("0,") + address});
        command.push_back("in");
        EXPECT_EQ(run(command, folder.path()).exitCode, 0);
        const std::string iso = readFile(folder / "disc.iso");
        std::string bytes = makeSectors(100, 5);
        for (size_t i = 0; i < iso.size(); i += 2048)
            bytes += '\0' + std::string(10, '\xFF') + std::string(4, '\0') + static_cast<char>(mode) +
                     std::string(mode == 2 ? 8 : 0, '\0') + iso.substr(i, 2048) +
                     std::string(mode == 2 ? 280 : 288, '\0');
        folder.write("disc.bin", isRaw ? bytes : bytes.substr(0, 100 * kSectorBytes) + iso);
        return SOpenDisc(folder.write("disc.cue", "FILE disc.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n"
                                                  "TRACK 02 MODE" +
                                                      std::to_string(mode) + (isRaw ? "/2352" : "/2048") +
                                                      "\nINDEX 01 00:01:25\n"));
    };
    const struct {
        const char* address;
        const char* naming;
        bool isRaw;
        int mode;
    } cases[] = {{"100", "-J", true, 1}, {"", "-R", true, 2}, {"11500", "-R", false, 1}};
    for (const auto& each : cases) {
        SCOPED_TRACE(each.address);
        const SOpenDisc disc = open(each.address, each.naming, each.isRaw, each.mode);
        ASSERT_TRUE(disc.disc) << disc.getError();
        EXPECT_TRUE(disc.readSegment(0) == makeSectors(100, 5));
        const Discio<DISCIO_DataCursor> root(DISCIO_DiscDataCreateCursorW(disc.disc.get(), u""));
        ASSERT_TRUE(root) << disc.getError();
        EXPECT_EQ(listAll(root.get()), (std::vector<std::string>{"\\Sub\\", "\\Sub\\Name of a file 7056"}));
        EXPECT_EQ(narrow(DISCIO_DiscDataGetTitleW(disc.disc.get())), "My disc");
        const Discio<DISCIO_DataCursor> file(DISCIO_DiscDataCreateCursorW(disc.disc.get(), u"Sub"));
        std::string bytes(content.size(), '\0');
        EXPECT_EQ(DISCIO_DataCursorNext(file.get()), 1);
        EXPECT_EQ(DISCIO_DataCursorRead(file.get(), 7, bytes.data(), 100000), 7049) << disc.getError();
        EXPECT_EQ(bytes.substr(0, 7049), content.substr(7));
    }
    // In a file of its own.
    open("11500", "-R", false, 1);
    const SOpenDisc apart(folder.write("apart.cue",
                                       "FILE audio.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n"
                                       "FILE disc.iso BINARY\nTRACK 02 MODE1/2048\n"
                                       "INDEX 01 00:00:00\n"));
    const Discio<DISCIO_DataCursor> root(DISCIO_DiscDataCreateCursorW(apart.disc.get(), u""));
    ASSERT_TRUE(root) << apart.getError();
    EXPECT_EQ(listAll(root.get()), (std::vector<std::string>{"\\Sub\\", "\\Sub\\Name of a file 7056"}));
    std::string damaged = readFile(folder / "disc.bin");
    damaged.replace(100 * kSectorBytes + 16 * 2048, 6, "\1XXXXX");
    folder.write("disc.bin", damaged);
    const SOpenDisc none(folder / "disc.cue");
    EXPECT_FALSE(Discio<DISCIO_DataCursor>(DISCIO_DiscDataCreateCursorW(none.disc.get(), u"")));
    EXPECT_EQ(DISCIO_GetLastError(none.library.get()), DISCIO_ERROR_BROKEN_FILE_SYSTEM) << none.getError();
}
