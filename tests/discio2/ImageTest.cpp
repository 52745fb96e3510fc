#include "discio2/DiscSupport.h"

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
        ASSERT_TRUE(open.disc) << open.getError();
        EXPECT_EQ(open.describe(), tracks);
        ASSERT_EQ(DISCIO_DiscAudioGetSegmentCount(open.disc.get()), static_cast<int>(samples.size()));
        for (size_t i = 0; i < samples.size(); ++i)
            EXPECT_TRUE(open.readSegment(static_cast<int>(i)) == samples[i]) << "track " << i + 1;
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
    folder.write("short.wav", toWave(c.substr(0, c.size() - 400)));
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
    // Sectors with their sub-channels.
    std::string graphics;
    for (size_t at = 0; at < all.size(); at += kSectorBytes)
        graphics += all.substr(at, kSectorBytes) + std::string(96, 'g');
    folder.write("all.cdg", graphics);
    expect("graphics.cue",
           "FILE all.cdg BINARY\nTRACK 01 CDG\nINDEX 01 00:00:00\nTRACK 02 CDG\nINDEX 01 00:00:20\n",
           "0+20-150 20+70-0 | 90", {a, b + c});
}

TEST_F(SImage, OtherSheetsDeliverTheSamplesOfTheirFiles) {
    folder.write("all.bin", swapPairs(a + b));
    folder.write("c.wav", toWave(c));
    expect("disc.toc",
           "CD_DA\nCATALOG \"1234567890123\"\nCD_TEXT { LANGUAGE_MAP { 0 : EN }\n LANGUAGE 0 { TITLE \"A "
           "\\\"B\\\"\" } }\n"
           "// Track 1\nTRACK AUDIO\nNO COPY\nISRC \"DEXXX0100001\"\nFILE \"all.bin\" 0 00:00:20\n"
           "TRACK AUDIO\nPREGAP 00:00:05\nFILE \"all.bin\" #47040 0\nTRACK AUDIO\nSILENCE 00:00:02\nSTART\n"
           "AUDIOFILE \"c.wav\" 588\n",
           "0+20-150 25+30-5 57+39-2 | 96", {a, b, c.substr(kSectorBytes)});
    const SOpenDisc toc(folder / "disc.toc");
    EXPECT_EQ(narrow(DISCIO_DiscAudioGetMetaDataStringW(toc.disc.get(), DISCIO_TEXT_TITLE)), "A \"B\"");
    EXPECT_EQ(narrow(DISCIO_DiscAudioGetMetaDataStringW(toc.disc.get(), DISCIO_TEXT_CODE)), "1234567890123");
    EXPECT_EQ(narrow(DISCIO_DiscAudioGetSegmentMetaDataStringW(toc.disc.get(), 0, DISCIO_TEXT_CODE)),
              "DEXXX0100001");
    // Sectors first: the pause before track 1, two tracks with a gap, then the chunks, in all versions.
    const std::string sectors = silence(150) + a + b;
    const size_t cut[] = {0, 150, 170, 175, 200};
    for (const int width : {8, 4}) {
        const std::string trailer =
            "END!" + big(0, 4) + (width == 8 ? "NER5" : "NERO") + big(sectors.size(), width);
        std::string entries = big(0, 4) + "1234567890123" + std::string(5, '\0');
        for (const size_t from : {size_t{0}, size_t{2}})
            entries += "DEXXX0100001" + big(kSectorBytes, 2) + '\7' + std::string(3, '\0') +
                       big(cut[from] * kSectorBytes, width) + big(cut[from + 1] * kSectorBytes, width) +
                       big(cut[from + 2] * kSectorBytes, width);
        expect("once.nrg",
               sectors + (width == 8 ? "DAOX" : "DAOI") + big(entries.size(), 4) + entries + trailer,
               "0+20-150 25+25-5 | 50", {a, b.substr(5 * kSectorBytes)});
        entries.clear();
        for (const size_t from : {size_t{1}, size_t{2}})
            entries += big(cut[from] * kSectorBytes, width) +
                       big((from == 1 ? 20 : 30) * kSectorBytes, width) + big(7, 4) + big(0, 4) +
                       std::string(static_cast<size_t>(width), '\0');
        expect("each.nrg",
               sectors + (width == 8 ? "ETN2" : "ETNF") + big(entries.size(), 4) + entries + trailer,
               "0+20-150 20+30-0 | 50", {a, b});
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
    const SOpenDisc open(
        folder.write("a.cue", "REM x\nCATALOG 0000000000001\nPERFORMER Band\nFILE a.bin BINARY\n"
                              "TRACK 01 AUDIO\nTITLE \"First one\"\nISRC DEXXX0100001\nINDEX 01 00:00:00\n"));
    ASSERT_TRUE(open.disc) << open.getError();
    EXPECT_EQ(narrow(DISCIO_DiscAudioGetSegmentMetaDataStringW(open.disc.get(), 0, DISCIO_TEXT_TITLE)),
              "First one");
    EXPECT_EQ(DISCIO_DiscAudioGetSegmentMetaDataStringW(open.disc.get(), 1, DISCIO_TEXT_TITLE), nullptr);
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_NO_SUCH_OBJECT);
    const std::pair<const char*, const char16_t*> titles[] = {
        {"Disc \xE9", u"Disc \u00E9"},       {"\xC4rzte", u"\u00C4rzte"},
        {"\xC3\x84rzte", u"\u00C4rzte"},     {"\xE2\x80x", u"\u00E2\u0080x"},
        {"\xE2\x80\x94", u"\u2014"},         {"\xED\x9F\xBF\xEE\x80\x80", u"\uD7FF\uE000"},
        {"\xF0\x9D\x84\x9E", u"\U0001D11E"}, {"\xF0\x9D\x84", u"\u00F0\u009D\u0084"}};
    for (const auto& [bytes, expected] : titles) {
        const SOpenDisc titled(folder.write("b.cue", std::string("TITLE \"") + bytes +
                                                         "\"\nFILE a.bin BINARY\nTRACK 01 AUDIO\n"
                                                         "INDEX 01 00:00:00\n"));
        EXPECT_EQ(std::u16string(DISCIO_DiscAudioGetMetaDataStringW(titled.disc.get(), DISCIO_TEXT_TITLE)),
                  expected);
    }
}

TEST_F(SImage, SeekingReachesEveryFrame) {
    folder.write("a.bin", a);
    const SOpenDisc open(folder.write("a.cue", "FILE a.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n"));
    const auto stream = open.openSegment(0);
    ASSERT_EQ(stream->funcs->open(stream->user), 1);
    for (const int64_t frame : {588 * 20 - 1, 0, 587, 588, 589, 5000}) {
        ASSERT_EQ(stream->funcs->seek(stream->user, frame), 1);
        std::string block(4 * 700, '\0');
        int32_t delivered = 0;
        ASSERT_EQ(stream->funcs->read(stream->user, block.data(), 700, &delivered), 1);
        const std::string expected = a.substr(static_cast<size_t>(frame) * 4, block.size());
        EXPECT_TRUE(block.substr(0, 4 * static_cast<size_t>(delivered)) == expected) << frame;
    }
    EXPECT_EQ(stream->funcs->seek(stream->user, 588 * 20 + 1), 0);
}

TEST_F(SImage, AnImageThatChangesIsALostDisc) {
    folder.write("a.bin", a);
    const SOpenDisc open(folder.write("a.cue", "FILE a.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n"));
    folder.write("a.bin", b);
    EXPECT_EQ(open.readSegment(0), "cannot be read");
    EXPECT_EQ(DISCIO_GetLastError(nullptr), DISCIO_ERROR_DISC_LOST) << open.getError();
}

TEST_F(SImage, BadImagesNameTheirFault) {
    folder.write("a.bin", a);
    folder.write("mono.wav", toWave(a).replace(22, 1, "\1"));
    const std::string file = "FILE a.bin BINARY\n", track = "TRACK 01 AUDIO\n", index = "INDEX 01 00:00:00\n";
    const struct {
        const char* name;
        std::string content;
        const char* reason;
    } cases[] = {
        {"1.cue", "", "there are no tracks"},
        {"2.cue", file + track, "track 1 has no INDEX 01"},
        {"3.cue", track + index, "line 2: there is no FILE before"},
        {"4.cue", "FILE gone.bin BINARY\n" + track + index, "gone.bin: No such file"},
        {"5.cue", file + track + "INDEX 01 00:00:75\n", "line 3: a time in the form"},
        {"6.cue", file + track + index + "TRACK 02 AUDIO\nINDEX 01 00:10:00\n",
         "a.bin is shorter than its tracks"},
        {"7.cue", file + track + index + "TRACK 01 AUDIO\nINDEX 01 00:00:05\n", "track 1 is out of order"},
        {"8.cue", "FILE mono.wav WAVE\n" + track + index, "mono.wav is not PCM of 16 bits in stereo"},
        {"9.cue", "FILE a.bin MP3\n" + track + index, "a.bin has the type MP3"},
        {"10.cue", file + "TRACK 01 MODE9\n" + index, "the mode MODE9 is not supported"},
        {"11.nrg", "x", "it has no table of contents"},
        {"12.toc", "CD_DA\nFILE \"a.bin\" 0\n", "there is no TRACK"},
        {"13.mp3", "x", "is not a disc image"},
        {"14.iso", "", "track 1 is empty"},
    };
    for (const auto& each : cases) {
        const SOpenDisc open(folder.write(each.name, each.content));
        EXPECT_FALSE(open.disc);
        EXPECT_NE(open.getError().find(each.reason), std::string::npos)
            << each.name << ": " << open.getError();
    }
}
