#include "discio2/DiscSupport.h"

#include <cstring>

using namespace tests;

namespace {

// All entries below a cursor, with "\" behind folders. Every file contains the first bytes of `content`,
// which are read as a whole and at random places.
std::vector<std::string> listAll(DISCIO_DataCursor* cursor, const std::string& content) {
    std::vector<std::string> found;
    std::minstd_rand random(1);
    while (DISCIO_DataCursorNext(cursor) == 1) {
        const std::string path = narrow(DISCIO_DataCursorGetDiscPathW(cursor));
        std::string bytes(800000, '\0');
        if (DISCIO_DataCursorIsFolder(cursor) == 1) {
            found.push_back(path + "\\");
            const Discio<DISCIO_DataCursor> sub(DISCIO_DataCursorCreateSubCursor(cursor));
            for (const std::string& each : listAll(sub.get(), content)) found.push_back(each);
            EXPECT_EQ(DISCIO_DataCursorRead(cursor, 0, bytes.data(), 1), -1);
            EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NOT_A_FILE);
            continue;
        }
        const int64_t size = DISCIO_DataCursorGetSize(cursor);
        found.push_back(path + " " + std::to_string(size));
        for (int i = 0; i < 20; ++i) {
            const int64_t offset = i == 0 ? 0 : random() % (size + 1);
            const int64_t wanted = i == 0 ? 800000 : random() % 5000;
            const int64_t got = DISCIO_DataCursorRead(cursor, offset, bytes.data(), wanted);
            EXPECT_EQ(got, std::min(wanted, size - offset)) << lastError();
            EXPECT_EQ(bytes.substr(0, static_cast<size_t>(std::max<int64_t>(got, 0))),
                      content.substr(static_cast<size_t>(offset), static_cast<size_t>(got)))
                << path << " " << offset;
        }
    }
    std::sort(found.begin(), found.end());
    return found;
}

} // namespace

// Other programs write the file systems.
TEST(Data, FilesAreListedAndReadInEveryFileSystem) {
    const CTempFolder folder;
    std::filesystem::create_directories(folder / "in/Sub folder/deep");
    const std::string content = makeSectors(300, 6);
    for (const auto& [name, size] : {std::pair("a rather long name.text", 5),
                                     {"empty", 0},
                                     {"one", 1},
                                     {"block", 2048},
                                     {"Sub folder/deep/x.bin", 700001}})
        folder.write("in/" + std::string(name), content.substr(0, static_cast<size_t>(size)));
    ASSERT_EQ(run({"touch", "-d", "@1000000000", "in/a rather long name.text"}, folder.path()).exitCode, 0);
    const std::vector<std::string> expected{"\\Sub folder\\",
                                            "\\Sub folder\\deep\\",
                                            "\\Sub folder\\deep\\x.bin 700001",
                                            "\\a rather long name.text 5",
                                            "\\block 2048",
                                            "\\empty 0",
                                            "\\one 1"};
    for (std::vector<std::string> options : std::vector<std::vector<std::string>>{
             {"-J"}, {"-R"}, {"-J", "-R"}, {"-udf", "-R"}, {"-udf", "-R", "only"}, {"-R", "raw"}}) {
        const std::string kind = options.back();
        SCOPED_TRACE(kind);
        if (!kind.starts_with('-')) options.pop_back();
        std::vector<std::string> command{"env", "TZ=XXX-5:30", "genisoimage", "-quiet",
                                         "-V",  "My disc",     "-o",          "disc.iso"};
        command.insert(command.end(), options.begin(), options.end());
        command.push_back("in");
        ASSERT_EQ(run(command, folder.path()).exitCode, 0);
        std::string bytes = readFile(folder / "disc.iso");
        const auto size = static_cast<int64_t>(bytes.size());
        // The library prefers ISO 9660: without its descriptors, only UDF is left.
        if (kind == "only") bytes.replace(16 * 2048, 3 * 2048, std::string(3 * 2048, '\0'));
        const SOpenDisc open(folder.write("disc.iso", kind == "raw" ? toRaw(bytes) : bytes));
        ASSERT_TRUE(open.disc) << lastError();
        EXPECT_EQ(DISCIO_DiscHasDataComponent(open.disc.get()), 1);
        EXPECT_EQ(DISCIO_DiscHasAudioComponent(open.disc.get()), 0);
        EXPECT_EQ(narrow(DISCIO_DiscDataGetTitleW(open.disc.get())), "My disc");
        const Discio<DISCIO_DataCursor> cursor(DISCIO_DiscDataCreateCursorW(open.disc.get(), u"\\"));
        ASSERT_TRUE(cursor) << lastError();
        char byte = 0;
        for (const bool isBehind : {false, true}) {
            EXPECT_EQ(DISCIO_DataCursorGetSize(cursor.get()) +
                          DISCIO_DataCursorRead(cursor.get(), 0, &byte, 1),
                      -2);
            EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NOT_PREPARED);
            EXPECT_TRUE(isBehind || listAll(cursor.get(), content) == expected);
        }
        EXPECT_EQ(DISCIO_DataCursorReset(cursor.get()), 1);
        while (DISCIO_DataCursorNext(cursor.get()) == 1) {
            const std::string name = narrow(DISCIO_DataCursorGetNameW(cursor.get()));
            EXPECT_EQ(DISCIO_DataCursorIsFile(cursor.get()) == 1, name != "Sub folder");
            if (name == "one") {
                EXPECT_EQ(DISCIO_DataCursorRead(cursor.get(), 0, nullptr, 0), 0);
                for (const auto& [offset, wanted] : {std::pair{-1, 1}, {0, -1}, {0, 1}})
                    EXPECT_EQ(DISCIO_DataCursorRead(cursor.get(), offset,
                                                    wanted + offset == 1 ? nullptr : &byte, wanted),
                              -1);
                EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_INVALID_PARAM);
            }
            EXPECT_EQ(DISCIO_DataCursorGetLastModifiedTime(cursor.get()) == 1'000'000'000,
                      name == "a rather long name.text");
        }
        EXPECT_EQ(DISCIO_DiscGetCapacityBytes(open.disc.get()), size);
        EXPECT_EQ(DISCIO_DiscGetFreeSpaceFraction(open.disc.get()), 0.0);
        EXPECT_EQ(DISCIO_DiscIsWritable(open.disc.get()) + DISCIO_DiscIsErasable(open.disc.get()), 0);
        EXPECT_EQ(DISCIO_DiscDataFolderExistsW(open.disc.get(), u"Sub folder\\deep\\"), 1);
        EXPECT_EQ(DISCIO_DiscDataFolderExistsW(open.disc.get(), u"Sub folder\\none"), 0);
        EXPECT_EQ(DISCIO_DiscDataFolderExistsW(open.disc.get(), u"one"), 0);
        EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NOT_A_FOLDER);
    }
}

TEST(Data, AMixedDiscHasBothComponents) {
    const CTempFolder folder;
    folder.write("file", "12345");
    ASSERT_EQ(run({"genisoimage", "-quiet", "-V", "My disc", "-J", "-o", "data.iso", "file"}, folder.path())
                  .exitCode,
              0);
    const std::string audio = makeSectors(10, 7);
    folder.write("audio.bin", audio);
    const std::string iso = readFile(folder / "data.iso");
    const size_t blocks = iso.size() / 2048;
    folder.write("data.raw", toRaw(iso));
    const std::string audioFile =
        "FILE audio.bin BINARY\nTRACK 02 AUDIO\nPREGAP 00:02:00\nINDEX 01 00:00:00\n";
    // The pause before the first track and that of the second one are in the file.
    const auto behindPause = 150 * 2048 + iso.size(), behindSecond = behindPause + 150 * kSectorBytes;
    const std::string entries =
        kDaoStart + toDaoEntry(8, 2048, 0, {0, 150 * 2048, behindPause}) +
        toDaoEntry(8, kSectorBytes, 7, {behindPause, behindSecond, behindSecond + audio.size()});
    const std::pair<const char*, std::string> sheets[] = {
        {"mixed.nrg",
         toNrg(std::string(150 * 2048, '\0') + iso + std::string(150 * kSectorBytes, '\0') + audio, "DAOX",
               entries)},
        {"mixed.cue", "FILE data.iso BINARY\nTRACK 01 MODE1/2048\nINDEX 01 00:00:00\n" + audioFile},
        {"raw.cue", "FILE data.raw BINARY\nTRACK 01 MODE1/2352\nINDEX 01 00:00:00\n" + audioFile},
        {"mixed.toc", "CD_ROM\nTRACK MODE1\nDATAFILE \"data.iso\"\nTRACK AUDIO\nPREGAP 00:02:00\n"
                      "FILE \"audio.bin\" SWAP 0\n"},
    };
    for (const auto& [name, sheet] : sheets) {
        SCOPED_TRACE(name);
        const SOpenDisc open(folder.write(name, sheet));
        ASSERT_TRUE(open.disc) << lastError();
        EXPECT_EQ(open.describe(), "0+" + std::to_string(blocks) + "-150 " + std::to_string(blocks + 150) +
                                       "+10-150 | " + std::to_string(blocks + 160));
        EXPECT_EQ(DISCIO_DiscGetComponentCount(open.disc.get()), 2);
        EXPECT_EQ(DISCIO_DiscGetComponentType(open.disc.get(), 0), 2);
        EXPECT_EQ(DISCIO_DiscGetComponentType(open.disc.get(), 1), 1);
        EXPECT_TRUE(open.readSegment(0) == audio);
        const Discio<DISCIO_DataCursor> cursor(DISCIO_DiscDataCreateCursorW(open.disc.get(), u""));
        EXPECT_EQ(listAll(cursor.get(), "12345"), std::vector<std::string>{"\\file 5"}) << lastError();
        const char16_t* const title = DISCIO_DiscDataGetTitleW(open.disc.get());
        EXPECT_EQ(getText(open.disc, -1), u"");
        EXPECT_EQ(narrow(title), "My disc") << "other functions leave it valid";
    }
}

// Behind audio, in a session of its own or not, with addresses from the start of the disc or of the track,
// and in every form of sectors.
TEST(Data, FilesBehindAudioAreRead) {
    const CTempFolder folder;
    std::filesystem::create_directories(folder / "in/Sub");
    const std::string content = makeSectors(3, 4), audio = makeSectors(100, 5);
    folder.write("in/Sub/Name of a file", content);
    std::filesystem::create_symlink("Name of a file", folder / "in/Sub/link");
    folder.write("audio.bin", audio);
    const auto makeIso = [&](const std::string& address, const char* naming) {
        std::vector<std::string> command{"genisoimage", "-quiet", "-V", "My disc", naming, "-o", "disc.iso"};
        if (!address.empty()) command.insert(command.end(), {"-C", "0," + address});
        command.push_back("in");
        EXPECT_EQ(run(command, folder.path()).exitCode, 0);
        return readFile(folder / "disc.iso");
    };
    const auto expectFiles = [&](const SOpenDisc& disc) {
        ASSERT_TRUE(disc.disc) << lastError();
        const auto blocks = std::to_string(std::filesystem::file_size(folder / "disc.iso") / 2048);
        EXPECT_TRUE(disc.describe().starts_with("0+100-150 100+" + blocks + "-0 | ")) << disc.describe();
        EXPECT_TRUE(disc.readSegment(0) == audio);
        const Discio<DISCIO_DataCursor> root(DISCIO_DiscDataCreateCursorW(disc.disc.get(), u""));
        ASSERT_TRUE(root) << lastError();
        EXPECT_EQ(listAll(root.get(), content),
                  (std::vector<std::string>{"\\Sub\\", "\\Sub\\Name of a file 7056"}));
        EXPECT_EQ(narrow(DISCIO_DiscDataGetTitleW(disc.disc.get())), "My disc");
    };
    const auto toCue = [](const std::string& mode) {
        return "FILE disc.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\nTRACK 02 " + mode +
               "\nINDEX 01 00:01:25\n";
    };
    using Names = std::vector<const char*>;
    const std::tuple<const char*, const char*, size_t, int, Names, Names, std::vector<int>> cases[] = {
        {"11500", "-R", 2048, 1, {"MODE1/2048", "MODE2/2048"}, {"MODE1", "MODE2_FORM1"}, {0, 2}},
        {"", "-R", 2352, 2, {"MODE2/2352"}, {"MODE2_RAW"}, {6}},
        {"100", "-R", 2336, 2, {"MODE2/2336"}, {"MODE2", "MODE2_FORM_MIX"}, {3}},
        {"100", "-J", 2448, 1, {"MODE1/2448"}, {}, {0xF, 0x11}},
        {"100", "-J", 2352, 1, {"MODE1/2352"}, {"MODE1_RAW"}, {5}}};
    for (const auto& [address, naming, size, form, cue, toc, nrg] : cases) {
        SCOPED_TRACE(size);
        const std::string iso = makeIso(address, naming);
        const std::string sectors = size == 2048 ? iso : toRaw(iso, form, size);
        folder.write("disc.bin", audio + sectors);
        for (const char* mode : cue) expectFiles(SOpenDisc(folder.write("disc.cue", toCue(mode))));
        const size_t blocks = iso.size() / 2048;
        for (const char* mode : toc)
            for (const std::string& length :
                 {std::string(), "0:" + std::to_string(blocks / 75) + ":" + std::to_string(blocks % 75),
                  std::to_string(sectors.size())})
                expectFiles(SOpenDisc(folder.write(
                    "disc.toc", "TRACK AUDIO FILE \"disc.bin\" SWAP 0 00:01:25\nTRACK " + std::string(mode) +
                                    " DATAFILE \"disc.bin\" #235200 " + length)));
        for (const int mode : nrg)
            expectFiles(SOpenDisc(folder.write(
                "disc.nrg",
                toNrg(audio + sectors, "DAOX",
                      kDaoStart + toDaoEntry(8, kSectorBytes, 7, {0, 0, audio.size()}) +
                          toDaoEntry(8, size, mode,
                                     {audio.size(), audio.size(), audio.size() + sectors.size()})))));
    }
    // A track that ends in the middle of a file is not continued by the next one's audio.
    const size_t middle = readFile(folder / "disc.bin").find(content.substr(0, 2048)) / kSectorBytes + 1;
    const SOpenDisc brief(folder.write(
        "brief.cue", readFile(folder / "disc.cue") + "TRACK 03 AUDIO\nINDEX 01 00:0" +
                         std::to_string(middle / 75) + ":" + std::to_string(middle % 75) + "\n"));
    const Discio<DISCIO_DataCursor> file(DISCIO_DiscDataCreateCursorW(brief.disc.get(), u"Sub"));
    ASSERT_EQ(DISCIO_DataCursorNext(file.get()), 1) << lastError();
    std::string bytes(content.size(), '\0');
    EXPECT_EQ(DISCIO_DataCursorRead(file.get(), 0, bytes.data(), 7056), -1);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NO_DATA) << lastError();
    // In a file of its own.
    std::string iso = makeIso("11500", "-R");
    expectFiles(
        SOpenDisc(folder.write("apart.cue", "FILE audio.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n"
                                            "FILE disc.iso BINARY\nTRACK 02 MODE1/2048\n"
                                            "INDEX 01 00:00:00\n")));
    // The root folder is nowhere, or there is no volume.
    for (const auto& [place, wrong] :
         {std::pair<size_t, const char*>{158, "\xFF\xFF\xFF\xFF"}, {0, "\1XXXXX"}}) {
        iso.replace(16 * 2048 + place, std::strlen(wrong), wrong);
        folder.write("disc.bin", audio + iso);
        const SOpenDisc none(folder.write("disc.cue", toCue("MODE1/2048")));
        EXPECT_FALSE(Discio<DISCIO_DataCursor>(DISCIO_DiscDataCreateCursorW(none.disc.get(), u"")));
        EXPECT_EQ(DISCIO_GetLastError(none.library.get()), DISCIO_ERROR_BROKEN_FILE_SYSTEM) << lastError();
        EXPECT_NE(lastError().find("the data track has no file system"), std::string::npos) << lastError();
    }
}

// The extents of a UDF file are replaced in its file entry, which is found by its size.
TEST(Data, FilesConsistOfExtents) {
    const CTempFolder folder;
    std::filesystem::create_directory(folder / "in");
    const std::string content = makeSectors(10, 6), zeros(4096, '\0');
    folder.write("in/aa", content.substr(0, 6144));
    folder.write("in/ab", content.substr(6144));
    ASSERT_EQ(run({"genisoimage", "-quiet", "-o", "disc.iso", "in"}, folder.path()).exitCode, 0);
    // Parts of large files have records of the same name.
    std::string image = readFile(folder / "disc.iso");
    image.replace(image.find("AB.;1"), 2, "AA");
    const SOpenDisc parts(folder.write("disc.iso", image));
    const Discio<DISCIO_DataCursor> root(DISCIO_DiscDataCreateCursorW(parts.disc.get(), u""));
    EXPECT_EQ(listAll(root.get(), content), std::vector<std::string>{"\\aa 23520"}) << lastError();
    std::filesystem::remove(folder / "in/aa");
    folder.write("in/ab", content);
    ASSERT_EQ(run({"genisoimage", "-quiet", "-udf", "-o", "disc.iso", "in"}, folder.path()).exitCode, 0);
    image = readFile(folder / "disc.iso").replace(16 * 2048, 3 * 2048, std::string(3 * 2048, '\0'));
    size_t entry = 0;
    while (image.substr(entry, 2) != "\5\1" || image.substr(entry + 56, 8) != little(23520, 8)) entry += 2048;
    const auto start =
        static_cast<unsigned char>(image[entry + 180]) | static_cast<unsigned char>(image[entry + 181]) << 8;
    // A descriptor of an extent, of its blocks from there on.
    const auto extent = [&](unsigned type, size_t bytes, int block, size_t size = 8) {
        return little(bytes | type << 30, 4) + little(static_cast<unsigned>(start + block), 4) +
               std::string(size - 8, 'x');
    };
    const std::string hole = content.substr(0, 4096) + zeros + content.substr(8192);
    // The form, the descriptors, the content that is expected, and the failure if that is empty.
    const std::tuple<char, std::string, std::string, int32_t> cases[] = {
        {0, extent(0, 8192, 0) + extent(0, 15328, 4), content, 0},
        {0, extent(0, 4096, 0) + extent(1, 4096, 2) + extent(0, 15328, 4), hole, 0},
        {1, extent(0, 4096, 0, 16) + extent(2, 4096, 2, 16) + extent(0, 15328, 4, 16), hole, 0},
        {0, extent(0, 23520, 0) + extent(3, 2048, 0), content, 0},
        {0, extent(0, 4096, 0) + extent(3, 2048, 0), "", DISCIO_ERROR_NOT_SUPPORTED},
        {2, extent(0, 23520, 0, 16), "", DISCIO_ERROR_NOT_SUPPORTED},
        {0, extent(0, 23519, 0) + extent(0, 0, 0) + extent(0, 2048, 0), "", DISCIO_ERROR_BROKEN_FILE_SYSTEM},
        {3, content.substr(100, 1800), content.substr(100, 1800), 0},
        {3, std::string(2048, 'x'), "", DISCIO_ERROR_NOT_SUPPORTED},
    };
    for (const auto& [form, descriptors, expected, code] : cases)
        for (const size_t attributes : {0u, 72u}) {
            SCOPED_TRACE(descriptors.size());
            std::string changed = image;
            const std::string filled =
                std::string(attributes, 'a') + descriptors.substr(0, 1872 - attributes);
            changed.replace(entry + 176, filled.size(), filled)
                .replace(entry + 168, 8, little(attributes, 4) + little(descriptors.size(), 4));
            changed[entry + 34] = form;
            const size_t size = form == 3 ? descriptors.size() : content.size();
            changed.replace(entry + 56, 8, little(size, 8));
            const SOpenDisc disc(folder.write("disc.iso", changed));
            const Discio<DISCIO_DataCursor> cursor(DISCIO_DiscDataCreateCursorW(disc.disc.get(), u""));
            if (!expected.empty()) {
                EXPECT_EQ(listAll(cursor.get(), expected),
                          std::vector<std::string>{"\\ab " + std::to_string(size)});
                continue;
            }
            ASSERT_EQ(DISCIO_DataCursorNext(cursor.get()), 1) << lastError();
            std::string bytes(size, '\0');
            EXPECT_EQ(DISCIO_DataCursorRead(cursor.get(), 0, bytes.data(), static_cast<int64_t>(size)), -1);
            EXPECT_EQ(DISCIO_GetLastError(nullptr), code) << lastError();
        }
}
