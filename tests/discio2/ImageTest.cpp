#include "discio2/DiscSupport.h"
#include "discio2/FakeDisc.h"

using namespace tests;

namespace {

struct SImage : testing::Test {
    CTempFolder folder;
    std::string a = makeSectors(20, 1), b = makeSectors(30, 2), c = makeSectors(40, 3);

    // Writes the sheet and expects these tracks with exactly these samples.
    void expect(const std::string& name, const std::string& sheet, const std::string& tracks,
                const std::vector<std::string>& samples) {
        SCOPED_TRACE(sheet);
        const SOpenDisc open(folder.write(name, sheet));
        ASSERT_TRUE(open.disc) << lastError();
        EXPECT_EQ(open.describe(), tracks);
        ASSERT_EQ(DISCIO_DiscAudioGetSegmentCount(open.disc.get()), static_cast<int>(samples.size()));
        int64_t repairs = -1;
        for (size_t i = 0; i < samples.size(); ++i)
            EXPECT_TRUE(open.readSegment(static_cast<int>(i), &repairs) == samples[i]) << "track " << i + 1;
        EXPECT_EQ(repairs, 0);
    }
};

std::string silence(size_t sectors) {
    return std::string(sectors * kSectorBytes, '\0');
}

} // namespace

// Every border between tracks is in one place, with and without pregaps, whatever the files look like.
TEST_F(SImage, CueSheetsDeliverTheSamplesOfTheirFiles) {
    const std::string all = a + b + c;
    folder.write("all.bin", all);
    folder.write("motorola.bin", swapPairs(all));
    folder.write("a.wav", toWave(a));
    folder.write("b.wav", toWave(b));
    // Its data end before their size does.
    folder.write("short.wav", toWave(c).substr(0, 44 + c.size() - 400));
    folder.write("odd.bin", a.substr(0, kSectorBytes + 1));
    // With extended format, a chunk of odd size in front of the data, and one behind them.
    folder.write("c.wav", toWave(c.substr(0, c.size() - 400))
                                  .replace(20, 2, "\xFE\xFF")
                                  .insert(36, "LIST" + little(3, 4) + std::string("abc", 4)) +
                              "LIST" + little(400, 4) + std::string(400, 'x'));
    const std::string three = "  TRACK 01 AUDIO\n    INDEX 01 00:00:00\n"
                              "  TRACK 02 AUDIO\n    INDEX 00 00:00:15\n    INDEX 01 00:00:20\n"
                              "  TRACK 03 AUDIO\n    INDEX 01 00:00:50\n";
    const std::string tracks = "0+15-150 20+30-5 50+40-0 | 90";
    const std::vector<std::string> samples{a.substr(0, 15 * kSectorBytes), b, c};
    expect("one.cue", "FILE all.bin BINARY\r\n" + three, tracks, samples);
    expect("two.cue",
           "\xEF\xBB\xBF"
           "FILE \"motorola.bin\" MOTOROLA\n" +
               three,
           tracks, samples);
    expect("lost.cue", "FILE \"C:\\Music\\all.bin\" BINARY\n" + three, tracks, samples);
    expect("files.cue",
           "FILE a.wav WAVE\nTRACK 01 AUDIO\nINDEX 01 00:00:00\nFILE b.wav WAVE\nTRACK 02 AUDIO\nPREGAP "
           "00:00:10\n"
           "INDEX 01 00:00:00\nFILE short.wav WAVE\nTRACK 03 AUDIO\nINDEX 00 00:00:00\nINDEX 01 00:00:02\n",
           "0+20-150 30+30-10 62+38-2 | 100",
           {a, b, c.substr(2 * kSectorBytes, 38 * kSectorBytes - 400) + std::string(400, '\0')});
    // The gap at the end of the file before, and a hidden track.
    expect("gaps.cue",
           "FILE a.wav WAVE\nTRACK 01 AUDIO\nINDEX 00 00:00:00\nINDEX 01 00:00:04\nTRACK 02 AUDIO\nINDEX 00 "
           "00:00:12\n"
           "FILE b.wav WAVE\nINDEX 01 00:00:00\nPOSTGAP 00:00:03\n",
           "4+8-154 20+33-8 | 53", {a.substr(4 * kSectorBytes, 8 * kSectorBytes), b + silence(3)});
    // Files without an index, and in front of the first one of a track.
    const std::string end = c.substr(0, c.size() - 400) + std::string(400, '\0');
    expect("skipped.cue",
           "file a.wav wave\ntrack 1 audio\nindex 1 0:0:0\nfile b.wav wave\nfile c.wav wave\ntrack 2 audio\n"
           "index 0 0:0:5\nindex 1 0:0:10\nfile odd.bin\tbinary\n",
           "0+55-150 60+32-5 | 92",
           {a + b + c.substr(0, 5 * kSectorBytes), end.substr(10 * kSectorBytes) +
                                                       a.substr(0, kSectorBytes + 1) +
                                                       std::string(kSectorBytes - 1, '\0')});
    expect("between.cue",
           "FILE a.wav WAVE\nTRACK 01 AUDIO\nINDEX 01 00:00:00\nTRACK 02 AUDIO\nPREGAP 1:59:74\nINDEX 00 "
           "00:00:15\nFILE b.wav WAVE\nFILE c.wav WAVE\nINDEX 01 00:00:03\nTRACK 99 AUDIO\n"
           "FILE a.wav WAVE\nINDEX 01 00:00:04\n",
           "0+15-150 9052+37-9037 9093+16-4 | 9109",
           {a.substr(0, 15 * kSectorBytes), end.substr(3 * kSectorBytes), a.substr(4 * kSectorBytes)});
    // Sectors with their sub-channels.
    std::string graphics;
    for (size_t at = 0; at < all.size(); at += kSectorBytes)
        graphics += all.substr(at, kSectorBytes) + std::string(96, 'g');
    folder.write("all.cdg", graphics.substr(0, graphics.size() - 500));
    expect("graphics.cue",
           "FILE all.cdg BINARY\nTRACK 01 CDG\nINDEX 01 00:00:00\nTRACK 02 CDG\nINDEX 01 00:00:20\n",
           "0+20-150 20+70-0 | 90", {a, b + c.substr(0, c.size() - 404) + std::string(404, '\0')});
}

TEST_F(SImage, OtherSheetsDeliverTheSamplesOfTheirFiles) {
    folder.write("all.bin", swapPairs(a + b));
    folder.write("c.wav", toWave(c));
    expect("disc.toc",
           "CD_DA\nCATALOG \"1234567890123\"\nCD_TEXT { LANGUAGE_MAP { 0 : EN }\n LANGUAGE 0 { TITLE \"A "
           "\\\"B\\\"\" } }\n"
           "// Track 1\nTRACK AUDIO\nNO COPY\nISRC \"DEXXX0100001\"\nFILE \"all.bin\" #0 0 00:00:20\n"
           "TRACK AUDIO\nPREGAP 00:00:05\nFILE \"all.bin\" #47040 0\nTRACK AUDIO\nSILENCE 00:00:02\nSTART\n"
           "AUDIOFILE \"c.wav\" 588\n",
           "0+20-150 25+30-5 57+39-2 | 96", {a, b, c.substr(kSectorBytes)});
    const SOpenDisc toc(folder / "disc.toc");
    EXPECT_EQ(getText(toc.disc, -1, DISCIO_TEXT_TITLE), u"A \"B\"");
    EXPECT_EQ(getText(toc.disc, -1, DISCIO_TEXT_CODE), u"1234567890123");
    EXPECT_EQ(getText(toc.disc, 0, DISCIO_TEXT_CODE), u"DEXXX0100001");
    // Sectors first: the pause before track 1, two tracks with a gap, then the chunks, in all versions.
    const std::string sectors = silence(150) + a + b;
    constexpr size_t kByte = kSectorBytes;
    for (const int width : {8, 4}) {
        const std::string packs = makeTextPacks({"Disc", "One"});
        expect("once.nrg",
               toNrg(sectors, width == 8 ? "DAOX" : "DAOI",
                     kDaoStart + toDaoEntry(width, kByte, 7, {0, 150 * kByte, 170 * kByte}) +
                         toDaoEntry(width, kByte, 7, {170 * kByte, 175 * kByte, 200 * kByte}),
                     "CDTX" + big(packs.size(), 4) + packs),
               "0+20-150 25+25-5 | 50", {a, b.substr(5 * kSectorBytes)});
        const SOpenDisc once(folder / "once.nrg");
        EXPECT_EQ(getText(once.disc, -1, DISCIO_TEXT_CODE), u"1234567890123");
        EXPECT_EQ(getText(once.disc, 1, DISCIO_TEXT_CODE), u"DEXXX0100001");
        EXPECT_EQ(getText(once.disc, -1) + getText(once.disc, 0), u"DiscOne");
        std::string entries;
        for (const size_t from : {size_t{150}, size_t{170}})
            entries += big(from * kByte, width) + big((from == 150 ? 20 : 30) * kByte, width) + big(7, 4) +
                       big(0, 4) + std::string(static_cast<size_t>(width), '\0');
        expect("each.nrg", toNrg(sectors, width == 8 ? "ETN2" : "ETNF", entries), "0+20-150 20+30-0 | 50",
               {a, b});
    }
    EXPECT_EQ(SOpenDisc(folder.write("x.iso", std::string(2049, 'x'))).describe(), "0+2-150 | 2");
    for (const auto& [length, end, type] : {std::tuple("100:0:0", 450000, 1), {"264600001", 450001, 4}}) {
        const SOpenDisc silent(folder.write("long.toc", std::string("TRACK AUDIO SILENCE ") + length));
        EXPECT_EQ(DISCIO_DiscGetTrackStartBlocks(silent.disc.get(), 1), end);
        EXPECT_EQ(DISCIO_DiscGetMediumType(silent.disc.get()), type);
    }
}

// Another program reads the same sheets.
TEST_F(SImage, PlacesAgreeWithARecordersProgram) {
    folder.write("all.bin", swapPairs(a + b + c));
    folder.write("disc.toc", "CD_DA\nTRACK AUDIO\nFILE \"all.bin\" 0 00:00:20\nSTART 00:00:03\nTRACK AUDIO\n"
                             "PREGAP 00:00:02\nFILE \"all.bin\" 00:00:20\n");
    folder.write("disc.cue",
                 "FILE \"all.bin\" BINARY\nTRACK 01 AUDIO\nINDEX 00 00:00:00\nINDEX 01 00:00:03\n"
                 "TRACK 02 AUDIO\nINDEX 00 00:00:15\nINDEX 01 00:00:20\nTRACK 03 AUDIO\nINDEX 01 00:01:00\n");
    for (const char* name : {"disc.toc", "disc.cue"}) {
        const SProcessResult peer = run({"cdrdao", "show-toc", "--force", name}, folder.path());
        ASSERT_EQ(peer.exitCode, 0) << peer.err;
        // Lines such as "START  00:00:03(     3)"; a track without a pregap has no line for it.
        std::string expected;
        int pregap = 150, start = 0, end = 0;
        std::istringstream lines(peer.out);
        for (std::string line; std::getline(lines, line);) {
            const int value = std::atoi(line.substr(std::min(line.find('(') + 1, line.size())).c_str());
            if (line.find("PREGAP") != line.npos) pregap += value;
            if (line.find("START") != line.npos) start = value;
            if (line.find("END") == line.npos) continue;
            end = value;
            expected += std::to_string(start) + "+" + std::to_string(end - start) + "-" +
                        std::to_string(pregap) + " ";
            pregap = 0;
        }
        EXPECT_EQ(SOpenDisc(folder / name).describe(), expected + "| " + std::to_string(end)) << peer.out;
    }
}

TEST_F(SImage, TextsComeFromTheSheet) {
    folder.write("a.bin", a);
    const std::string names[] = {"TITLE",    "PERFORMER", "SONGWRITER", "COMPOSER",
                                 "ARRANGER", "MESSAGE",   "DISC_ID",    "GENRE"};
    std::string all, own;
    for (const std::string& name : names)
        all += name + " \"all " + name + "\"\n", own += name + " \"" + name + "\"\n";
    for (const auto& [name, sheet] :
         {std::pair{"a.cue", "REM x\nCATALOG 0000000000001\n" + all + "FILE a.bin BINARY\nTRACK 01 AUDIO\n" +
                                 own + "ISRC DEXXX0100001\nINDEX 01 00:00:00\n"},
          {"a.toc", "CD_TEXT { LANGUAGE_MAP { 0 : EN 1 : 7 }\nLANGUAGE 0 { SIZE_INFO { 1, 2 } UPC_EAN "
                    "\"0000000000001\"" +
                        all + "}\nLANGUAGE 1 {" + own + "} }\nTRACK AUDIO\nCD_TEXT { LANGUAGE 0 {" + own +
                        "ISRC \"DEXXX0100001\" } }\nFILE \"a.bin\" 0\n"}}) {
        const SOpenDisc open(folder.write(name, sheet));
        ASSERT_TRUE(open.disc) << lastError();
        for (int i = 0; i < (name == std::string("a.cue") ? 8 : 7); ++i) {
            EXPECT_EQ(getText(open.disc, -1, i), wide("all " + names[i]));
            EXPECT_EQ(getText(open.disc, 0, i), wide(names[i]));
        }
        EXPECT_EQ(getText(open.disc, -1, DISCIO_TEXT_CODE), u"0000000000001");
        EXPECT_EQ(getText(open.disc, 0, DISCIO_TEXT_CODE), u"DEXXX0100001");
        EXPECT_EQ(getText(open.disc, 0, 16) + getText(open.disc, 0, -1), u"(null)(null)");
        EXPECT_EQ(getText(open.disc, 1), u"(null)");
        EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NO_SUCH_OBJECT);
    }
    const std::string packs = makeTextPacks({"Disc", "One"});
    for (const std::string& bytes : {packs, "size" + packs, packs + "12345"}) {
        folder.write("a.cdt", bytes);
        const SOpenDisc open(folder.write("c.cue", "CDTEXTFILE a.cdt\nFILE a.bin BINARY\nTRACK 01 AUDIO\n"
                                                   "INDEX 01 00:00:00\n"));
        EXPECT_EQ(getText(open.disc, -1) + getText(open.disc, 0), u"DiscOne");
    }
    for (const auto& [bytes, expected] : {std::pair{"\xC4rzte", u"\u00C4rzte"},
                                          {"\xC3\x84rzte", u"\u00C4rzte"},
                                          {"\xE2\x80x", u"\u00E2\u0080x"},
                                          {"\xF4\x8F\xBF\xBF\xEE\x80\x80", u"\U0010FFFF\uE000"},
                                          {"\xF0\x9D\x84", u"\u00F0\u009D\u0084"}}) {
        const SOpenDisc titled(folder.write("b.cue", std::string("TITLE \"") + bytes +
                                                         "\"\nFILE a.bin BINARY\nTRACK 01 AUDIO\n"
                                                         "INDEX 01 00:00:00\n"));
        EXPECT_EQ(getText(titled.disc, -1), expected);
    }
}

TEST_F(SImage, SeekingReachesEveryFrame) {
    folder.write("a.bin", a);
    const SOpenDisc open(folder.write("a.cue", "FILE a.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n"));
    for (const int index : {-1, 1}) {
        EXPECT_EQ(DISCIO_OpenDrive(open.library.get(), index), nullptr);
        EXPECT_EQ(DISCIO_DiscGetTrackLengthBlocks(open.disc.get(), index), -1);
        EXPECT_FALSE(open.openSegment(index));
        EXPECT_NE(lastError().find("(track " + std::to_string(index + 1) + ")"), std::string::npos);
    }
    const auto stream = open.openSegment(0);
    for (int32_t delivered = 1, sample = 0; delivered > 0;) { // closed
        EXPECT_EQ(stream->funcs->seek(stream->user, 0) + stream->funcs->getRepairs(stream->user), -1);
        EXPECT_EQ(stream->funcs->read(stream->user, &sample, 1, &delivered), 0);
        EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_STREAM_NOT_OPEN);
    }
    ASSERT_EQ(stream->funcs->open(stream->user), 1);
    for (const int64_t frame : {588 * 20 - 1, 0, 587, 588, 589, 5000}) {
        ASSERT_EQ(stream->funcs->seek(stream->user, frame), 1);
        std::string block(4 * 700, '\0');
        int32_t delivered = 0;
        ASSERT_EQ(stream->funcs->read(stream->user, block.data(), 700, &delivered), 1);
        const std::string expected = a.substr(static_cast<size_t>(frame) * 4, block.size());
        EXPECT_TRUE(block.substr(0, 4 * static_cast<size_t>(delivered)) == expected) << frame;
    }
    for (const auto& [frame, result] : {std::pair{588 * 20 + 1, 0}, {588 * 20, 1}, {-1, 0}})
        EXPECT_EQ(stream->funcs->seek(stream->user, frame), result);
    stream->funcs->close(stream->user);
    EXPECT_EQ(stream->funcs->getRepairs(stream->user), -1);
}

TEST_F(SImage, AnImageThatChangesIsALostDisc) {
    // The time, the size and the place in the folder, each on its own.
    for (const int change : {0, 1, 2}) {
        const auto path = folder.write("a.bin", a);
        const SOpenDisc open(folder.write("a.cue", "FILE a.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n"));
        const auto time = std::filesystem::last_write_time(path);
        if (change == 1) folder.write("a.bin", b);
        std::filesystem::last_write_time(path, time + std::chrono::seconds(change == 0));
        if (change == 2) std::filesystem::remove(path);
        EXPECT_TRUE(open.readSegment(0).ends_with("a.bin has changed since it was opened)"));
        EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_LOST);
    }
}

TEST_F(SImage, BadImagesNameTheirFault) {
    folder.write("a.bin", a);
    int32_t code = DISCIO_ERROR_UNSUPPORTED_FORMAT;
    const auto refuse = [&](const std::string& extension, const std::string& reason,
                            const std::vector<std::string>& contents) {
        for (const std::string& content : contents) {
            EXPECT_FALSE(SOpenDisc(folder.write("disc." + extension, content)).disc);
            EXPECT_EQ(DISCIO_GetLastError(nullptr), code);
            EXPECT_NE(lastError().find(reason), std::string::npos)
                << content.substr(0, 99) << ": " << lastError();
        }
    };
    const std::string file = "FILE a.bin BINARY\n", index = "TRACK 01 AUDIO\nINDEX 01 0:0:0\n";
    const std::string second = file + index + "TRACK 02 AUDIO\nINDEX 01 0:0:10\nTRACK 03 AUDIO\nINDEX ";
    const std::string filler((1 << 20) - 3, ' '), brief = "a.bin is shorter than its tracks";
    refuse("cue", "there are no tracks", {"", "REM" + filler});
    refuse("cue", "is too large for a sheet", {"REM " + filler});
    refuse("cue", "track 1 has no INDEX 01",
           {file + "TRACK 01 AUDIO", file + "TRACK 01 AUDIO\nINDEX 02 0:0:0"});
    refuse("cue", "line 1: there is no FILE before", {"INDEX 01 0:0:0"});
    refuse("cue", "line 2: there is no TRACK before", {file + "INDEX 01 0:0:0", file + "PREGAP 0:0:1"});
    refuse("cue", "track 1 is empty", {file + "TRACK 01 AUDIO\nINDEX 01 0:0:20"});
    refuse("cue", "an INDEX is before the previous",
           {second + "01 0:0:9", second + "02 0:0:12\nINDEX 01 0:0:11"});
    refuse("cue", brief, {second + "01 0:10:0"});
    refuse("cue", " is out of order",
           {file + "TRACK 00 AUDIO\nINDEX 01 0:0:0", second + "01 0:0:15\nTRACK 03 AUDIO\nINDEX 01 0:0:16"});
    refuse("cue", "a.bin has the type MPZ`{A,", {"FILE a.bin mpz`{a\n" + index});
    refuse("cue", "the mode MODE9 is not supported", {file + "TRACK 01 MODE9\nINDEX 01 0:0:0"});
    for (const char* number : {"", "x", "-1", "100", "1x"})
        refuse("cue", "line 2: a number from 0 to 99 is", {file + "TRACK \"" + number + "\" AUDIO"});
    for (const char* time :
         {"", "0:0", "0:0:0:0", "0::0", ":0:0", "0:0:", "0:60:0", "0:0:75", "00000:0:0", "0:0:/"})
        refuse("cue", "a time in the form MM:SS:FF", {file + "TRACK 01 AUDIO\nINDEX 01 \"" + time + "\""});
    for (const size_t place : {0u, 8u, 12u, 20u, 22u, 24u, 34u, 36u}) {
        folder.write("a.wav", toWave(a).replace(place, 1, "x"));
        refuse("cue",
               place < 12    ? "a.wav is not a WAV file"
               : place == 12 ? "a.wav has sound data before its format"
               : place == 36 ? "a.wav has no sound data"
                             : "a.wav is not PCM of 16 bits in stereo at 44100 Hz",
               {"FILE a.wav WAVE\n" + index});
    }
    const auto dao = [&](size_t size, int mode, const std::vector<size_t>& places) {
        return toNrg(a, "DAOX", kDaoStart + toDaoEntry(8, size, mode, places));
    };
    const auto each = [](uint64_t start, uint64_t length) {
        return big(start, 8) + big(length, 8) + big(7, 4) + big(0, 12);
    };
    refuse("nrg", "it has no table of contents", {"x", a});
    refuse("nrg", "there are no tracks", {toNrg(a, "CUEX", "")});
    refuse("nrg", "a track has an unknown mode", {dao(2352, 8, {0, 0, 2352}), dao(2048, 7, {0, 0, 2352})});
    refuse("nrg", "several sessions are",
           {toNrg(a, "ETN2", each(0, 2352), "ETN2" + big(32, 4) + each(0, 2352))});
    refuse("nrg", "its table of contents is damaged",
           {toNrg(a, "DAOX", std::string(21, 'x')),
            a + "DAOX" + big((1 << 20) + 1, 4) + "NER5" + big(a.size(), 8), dao(2352, 7, {2352, 0, 4704}),
            dao(2352, 7, {0, 4704, 2352}), dao(2352, 7, {0, 0, 1 << 20}), dao(2352, 7, {0, 2351, 4704}),
            dao(2352, 7, {size_t{1} << 63, 0, 0}), toNrg(a, "ETN2", each(0, uint64_t{1} << 63)),
            toNrg(a, "ETN2", each(uint64_t{1} << 63, 0)), toNrg(a, "ETN2", each(1, INT64_MAX)),
            toNrg(a, "ETN2", each(1, 1 << 20))});
    const std::string audio = "TRACK AUDIO FILE \"a.bin\" ", data = "TRACK MODE1 DATAFILE \"a.bin\" ";
    refuse("toc", "there are no tracks", {"// " + filler});
    refuse("toc", "is too large for a sheet", {"//  " + filler});
    refuse("toc", "the mode MODE9 is not supported", {"TRACK MODE9"});
    refuse("toc", "a data track has audio", {"TRACK MODE1 FILE \"a.bin\" 0"});
    refuse("toc", brief,
           {data + "0:0:23", data + "47041", audio + "0 0:0:21", audio + "#47041 0", audio + "2147483647"});
    refuse("toc", "is expected instead of ", {audio + "2147483648", audio + "1x"});
    refuse("toc", "there is no TRACK before its content",
           {"FILE \"a.bin\" 0", "DATAFILE \"a.bin\"", "SILENCE 1", "PREGAP 1", "START"});
    for (const char* offset : {"#", "#-1", "#1x", "#1125899906842625", "#9223372036854775808"})
        refuse("toc", "an offset is invalid", {audio + offset + " 1"});
    refuse("mp3", "is not a disc image: .cue, .iso, .nrg and .toc are known", {"x"});
    refuse("iso", "track 1 is empty", {""});
    code = DISCIO_ERROR_NOT_FOUND;
    refuse("cue", "gone.bin: No such file", {"FILE gone.bin BINARY\n"});
    code = DISCIO_ERROR_READ_INPUT;
    refuse("cue", "n: File name too long", {"FILE " + std::string(300, 'n') + " BINARY\n"});
    code = DISCIO_ERROR_NOT_A_FILE;
    refuse("cue", "is not a regular file", {"FILE . BINARY\n"});
}
