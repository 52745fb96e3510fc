// Written files are read back by our own decoders and by other programs.
#include "plugins/PluginFixture.h"

#include <sndfile.h>

namespace tests {

namespace {

constexpr int kFrames = 30011; // odd and longer than a chunk

class RoundTrip : public CFormatTest {};

TEST_P(RoundTrip, Lossless_IsBitExactInEveryShape) {
    const SFormatCase& format = GetParam();
    if (!format.lossless) return;
    for (int bytes : format.widths) {
        for (int channels : format.channels) {
            SCOPED_TRACE(std::to_string(bytes) + " bytes, " + std::to_string(channels) + " channels");
            const SShape shape{44100, channels, bytes};
            const std::string pcm = makeMusic(shape, kFrames);
            P<IAudioFormat> target = makeFormat(named(), shape);
            ASSERT_TRUE(target);
            const int64_t estimate = target->getEstimatedSizeBytes(kFrames / 44100.0);
            writeAll(target, pcm, shape);
            const auto size = static_cast<int64_t>(std::filesystem::file_size(named()));
            EXPECT_TRUE(!format.exactEstimate || estimate == size) << estimate << ", " << size;

            P<IAudioSource> source = openSource(named(), shape);
            ASSERT_TRUE(source);
            EXPECT_DOUBLE_EQ(kFrames / 44100.0, source->getDuration());
            EXPECT_TRUE(readAll(source) == pcm);
            EXPECT_FALSE(source->getNextAudioChunk());
            // Reopening starts again at the beginning.
            source->close();
            EXPECT_EQ(channels, source->getChannelCount());
            source->open();
            EXPECT_TRUE(readAll(source) == pcm);

            if (channels != 2 && bytes != 2) continue;
            EXPECT_TRUE(decodeByPeer(named().filename(), bytes) == pcm)
                << "another program reads something else";
            check(named().filename());
        }
    }
}

// The host writes under a temporary name; the final name decides the container.
TEST_P(RoundTrip, TemporaryName_DoesNotChangeTheContainer) {
    const SShape shape{44100, 2, GetParam().widths.back()};
    const std::string pcm = makeMusic(shape, 5000), magic = GetParam().magic;
    writeFile(named(), pcm, shape);
    for (const std::string suffix : {"part", ".part"}) {
        handler->setURISuffix(suffix.c_str());
        const auto path = named().string() + suffix;
        writeFile(path, pcm, shape);
        EXPECT_EQ(magic, readFile(path).substr(0, magic.size()));
        // Lossy files may contain a random serial number.
        EXPECT_EQ(std::filesystem::file_size(named()), std::filesystem::file_size(path));
        EXPECT_TRUE(!GetParam().lossless || readFile(named()) == readFile(path));
    }
}

TEST_P(RoundTrip, StoppedInTheMiddle_LeavesAValidFile) {
    for (const std::string& pcm : {std::string(), makeMusic({}, 20000)}) {
        P<IAudioFormat> format = makeFormat(named());
        format->open();
        if (!pcm.empty()) format->writeAudioChunk(makeChunk(pcm));
        format.reset(); // without close(), as happens when an exception leaves the encoder
        check(named().filename());
        const std::string played = read(named());
        EXPECT_TRUE(GetParam().lossless ? played == pcm : played.empty() == pcm.empty());
    }
}

INSTANTIATE_TEST_SUITE_P(Formats, RoundTrip, ::testing::ValuesIn(kFormatCases), printName);

struct SPeerFile {
    const char* name;
    const char* command; // makes the file from in.wav, 24 bit stereo
    int bytes;           // bytes per sample to expect
    bool exact;          // the samples equal those decoded by ffmpeg
    const char* codec = "PCM signed 16 bit";
};

const SPeerFile kPeerFiles[] = {
    {"a.wav", "ffmpeg -v error -i in.wav -c:a pcm_u8 a.wav", 1, true, "PCM unsigned 8 bit"},
    {"c.wav", "ffmpeg -v error -i in.wav -c:a pcm_f32le c.wav", 4, true, "PCM float 32 bit"},
    {"d.wav", "ffmpeg -v error -i in.wav -c:a pcm_f64le d.wav", 4, true, "PCM float 64 bit"},
    {"f.wav", "ffmpeg -v error -i in.wav -c:a pcm_s16le -rf64 always f.wav", 2, true},
    {"stream.wav", "ffmpeg -v error -i in.wav -f wav -c:a pcm_s16le - > stream.wav", 2, true},
    {"pipe64.wav", "ffmpeg -v error -i in.wav -f wav -rf64 always - > pipe64.wav", 2, false},
    {"pipe.caf", "ffmpeg -v error -i in.wav -f caf -c:a pcm_s16be - > pipe.caf", 2, true},
    {"rifx.wav", "sox in.wav -B -b 16 -D rifx.wav", 2, true},
    {"mu.wav", "ffmpeg -v error -i in.wav -c:a pcm_mulaw mu.wav", 2, true, "\u00b5-law"},
    {"al.caf", "ffmpeg -v error -i in.wav -c:a pcm_alaw al.caf", 2, true, "A-law"},
    {"g.aiff", "sox in.wav -b 8 -D g.aiff", 1, true, "PCM signed 8 bit"},
    {"i.caf", "ffmpeg -v error -i in.wav -c:a pcm_s24be i.caf", 3, true, "PCM signed 24 bit"},
    {"alac16.caf", "ffmpeg -v error -i in.wav -c:a alac -sample_fmt s16p alac16.caf", 2, true, "ALAC"},
    {"alac24.caf", "ffmpeg -v error -i in.wav -c:a alac alac24.caf", 3, true, "ALAC"},
    {"j.w64", "sox in.wav -b 16 -D j.w64", 2, true},
    {"k.snd", "ffmpeg -v error -i in.wav -f au -c:a pcm_s16be k.snd", 2, true},
    {"l.flac", "flac -s8 in.wav -o l.flac", 3, true, "FLAC"},
    // Written to a pipe: the header has neither length nor checksum.
    {"n.flac", "flac -sc in.wav | cat > n.flac", 3, true, "FLAC"},
    {"tagged.flac", "flac -s in.wav -o tagged.flac && head -c 300 /dev/zero | tr '\\0' T >> tagged.flac", 3,
     false, "FLAC"}};

TEST_F(CPluginTest, PeerFile_IsReadAsItsOwnProgramReadsIt) {
    const SShape shape{44100, 2, 3};
    writeFile(folder / "in.wav", makeMusic(shape, 20011), shape);
    for (const SPeerFile& file : kPeerFiles) {
        SCOPED_TRACE(file.name);
        run(file.command);
        P<IAudioSource> source = openSource(folder / file.name, {44100, 2, file.bytes});
        ASSERT_TRUE(source);
        const std::string pcm = readAll(source);
        ASSERT_EQ(20011u * 2 * file.bytes, pcm.size());
        EXPECT_EQ(file.codec, codecOf(source));
        EXPECT_TRUE(!file.exact || pcm == decodeByPeer(file.name, file.bytes));
    }
}

TEST_F(CPluginTest, UnsupportedCodec_IsNamed) {
    writeFile(folder / "in.wav", makeMusic({}, 5000));
    const std::tuple<const char*, const char*, const char*> files[] = {
        {"x.caf", "-c:a adpcm_ima_qt", "IMA ADPCM (ima4)"},
        {"y.caf", "-c:a libopus -ar 48000", "Opus (opus)"},
        {"x.wav", "-c:a ac3", "AC-3 (0x2000)"},
    };
    for (const auto& [name, options, codec] : files) {
        run("ffmpeg -v error -i in.wav " + std::string(options) + " " + name);
        log->lines.clear();
        EXPECT_FALSE(openSource(folder / name)) << name;
        ASSERT_FALSE(log->lines.empty());
        EXPECT_NE(std::string::npos, log->lines[0].find("the codec " + std::string(codec) +
                                                        " is not supported in this type of file"))
            << log->lines[0];
    }
}

// Sizes in a header of 44 bytes, over two frames of 16 bit stereo and what follows them.
TEST_F(CPluginTest, WavSizes_AreCheckedAgainstTheFile) {
    const std::string sound("\1\2\3\4\5\6\7\10", 8), list("LIST\4\0\0\0INFO", 12), silence(8, '\0');
    struct {
        uint32_t riff, data;
        std::string body, expected;
    } const cases[] = {
        {44, 8, sound, sound},
        {46, 10, sound, sound},                          // too large
        {1044, 1008, sound, sound},                      // far too large
        {44, 8, sound.substr(0, 7), sound.substr(0, 4)}, // truncated
        {0xFFFFFFFF, 0xFFFFFFFF, sound, sound},          // written to a pipe
        {0, 0, sound, sound},                            // never completed
        {36, 0, sound, sound},                           // the same with the size of the header
        {36, 0, silence, silence},                       // which is not an empty chunk
        {48, 0, list, ""},                               // empty, with a list behind
        {36, 0, "", ""},                                 // empty
        {56, 8, sound + list, sound},
    };
    for (const auto& row : cases) {
        SCOPED_TRACE(std::to_string(row.riff) + ", " + std::to_string(row.data));
        const auto number = [](uint32_t value) { return std::string(reinterpret_cast<char*>(&value), 4); };
        const auto path = folder.write("x.wav", "RIFF" + number(row.riff) + "WAVEfmt " + number(16) +
                                                    number(0x20001) + number(44100) + number(176400) +
                                                    number(0x100004) + "data" + number(row.data) + row.body);
        P<IAudioSource> source = openSource(path);
        ASSERT_TRUE(source);
        EXPECT_EQ(row.expected.size() / 4 / 44100.0, source->getDuration());
        EXPECT_EQ(row.expected, readAll(source));
    }
}

// Where the codec is lossless, all frames come back.
TEST_F(CPluginTest, CompressedFile_IsNamedAndRead) {
    const SShape shape{8000, 1, 2};
    const std::string pcm = makeMusic(shape, 20011);
    const std::tuple<const char*, int, const char*, size_t> files[] = {
        {"x.wav", SF_FORMAT_WAV | SF_FORMAT_IMA_ADPCM, "IMA ADPCM", 0},
        {"x.wav", SF_FORMAT_WAV | SF_FORMAT_MS_ADPCM, "Microsoft ADPCM", 0},
        {"x.wav", SF_FORMAT_WAV | SF_FORMAT_GSM610, "GSM 06.10", 0},
        {"x.au", SF_FORMAT_AU | SF_FORMAT_G721_32, "G.721 ADPCM", 0},
        {"x.au", SF_FORMAT_AU | SF_FORMAT_G723_40, "G.723 ADPCM", 0},
        {"x.aiff", SF_FORMAT_AIFF | SF_FORMAT_DWVW_16, "DWVW", 2},
        {"x.caf", SF_FORMAT_CAF | SF_FORMAT_ALAC_16, "ALAC", 2},
        {"x.caf", SF_FORMAT_CAF | SF_FORMAT_ALAC_24, "ALAC", 3},
        {"x.caf", SF_FORMAT_CAF | SF_FORMAT_ALAC_32, "ALAC", 4}};
    for (const auto& [name, format, codec, bytes] : files) {
        SF_INFO info{0, 8000, 1, format, 0, 0};
        SNDFILE* file = sf_open((folder / name).c_str(), SFM_WRITE, &info);
        sf_writef_short(file, reinterpret_cast<const short*>(pcm.data()), 20011);
        sf_close(file);
        P<IAudioSource> source =
            openSource(folder / name, {8000, 1, bytes > 0 ? static_cast<int>(bytes) : 2});
        ASSERT_TRUE(source);
        EXPECT_EQ(codec, codecOf(source));
        const std::string got = readAll(source);
        std::string upper;
        for (size_t i = bytes - 2; bytes > 0 && i < got.size(); i += bytes) upper += got.substr(i, 2);
        EXPECT_TRUE(bytes > 0 ? pcm == upper : got.size() >= pcm.size()) << codec << ", " << got.size();
        source->skipToTime(0.5);
        EXPECT_TRUE(readAll(source) == got.substr(4000 * (bytes > 0 ? bytes : 2))) << codec;
    }
    writeFile(folder / "x.wav", pcm, shape);
    const std::string wav = readFile(folder / "x.wav");
    folder.write("x.wav", std::string("ID3\4\0\0\0\0\1\2", 10) + std::string(130, '\0') + wav);
    EXPECT_TRUE(pcm == read(folder / "x.wav", shape)) << "behind a tag";
}

// Only the width changes: samples are rounded, or extended by zeros, whatever the number of channels.
TEST_F(CPluginTest, Width_ChangesWithoutAFilter) {
    for (const auto& [channels, from, to] :
         {std::tuple{1, 3, 2}, {2, 4, 2}, {2, 2, 1}, {6, 3, 2}, {8, 4, 3}, {2, 1, 2}, {8, 2, 4}, {3, 3, 4}}) {
        SCOPED_TRACE(std::to_string(channels) + ", " + std::to_string(from) + " to " + std::to_string(to));
        const SShape own{44100, channels, from};
        const std::string pcm = makeMusic(own, 9001);
        writeFile(folder / "x.wav", pcm, own);
        const std::string got = read(folder / "x.wav", {44100, channels, to});
        ASSERT_EQ(pcm.size() / from * to, got.size());
        const auto at = [](const std::string& samples, int bytes, size_t i) {
            uint32_t bits = 0;
            std::memcpy(reinterpret_cast<char*>(&bits) + 4 - bytes, &samples[i * bytes], bytes);
            return static_cast<int32_t>(bytes == 1 ? bits ^ 0x80000000u : bits);
        };
        const int64_t step = int64_t{1} << (32 - 8 * to), highest = (int64_t{1} << 31) - step;
        int64_t worst = 0;
        for (size_t i = 0; i < got.size() / to; ++i)
            worst = std::max(worst, std::abs(at(got, to, i) - std::min<int64_t>(at(pcm, from, i), highest)));
        EXPECT_LE(worst, from > to ? step / 2 : 0);
    }
}

TEST_F(CPluginTest, FlacSettings_AreThoseOfItsOwnEncoder) {
    const std::string pcm = makeMusic({}, 44100 * 35);
    writeFile(folder / "in.wav", pcm);
    for (int level : {-1, 0, 5, 8}) { // -1: none was set
        SCOPED_TRACE(level);
        P<IAudioFormat> format = makeFormat(folder / "ours.flac");
        if (level >= 0) format->setAudioQuality(level / 8.0);
        writeAll(format, pcm);
        run("flac -sf" + std::to_string(level < 0 ? 5 : level) + " in.wav -o theirs.flac");
        const auto list = [this](const std::string& file) {
            const std::string points =
                run("metaflac --list --block-type=SEEKTABLE " + file + " | grep 'point [0-3]:'");
            const std::string sum = run("metaflac --show-md5sum " + file);
            run("metaflac --remove-all --dont-use-padding " + file);
            return points + sum + readFile(folder / file); // only the frames are left, and stream information
        };
        EXPECT_TRUE(list("ours.flac") == list("theirs.flac"));
    }
}

} // namespace

} // namespace tests
