// Written files are read back by our own decoders and by other programs.
#include "plugins/PluginFixture.h"

#include "sonora2/context/SonoraError.h"

#include <vector>

namespace tests {

namespace {

class RoundTrip : public CPluginTest, public ::testing::WithParamInterface<SFormatCase> {
protected:
    static constexpr int kFrames = 30011; // odd and longer than a chunk
};

class LosslessRoundTrip : public RoundTrip {};

std::vector<SFormatCase> getLosslessCases() {
    std::vector<SFormatCase> cases;
    for (const SFormatCase& format : kFormatCases)
        if (format.lossless) cases.push_back(format);
    return cases;
}

// The samples of a file as decoded by another program.
std::string readByPeer(const std::filesystem::path& path, int bytes) {
    if (path.extension() == ".flac") { // also handles 32 bits, unlike ffmpeg
        return run("flac -sdc --force-raw-format --endian=little --sign=" +
                   std::string(bytes == 1 ? "unsigned '" : "signed '") + path.string() + "'");
    }
    static const char* const kCoders[] = {"", "u8", "s16le", "s24le", "s32le"};
    const std::string coder = kCoders[bytes];
    return run("ffmpeg -v error -i '" + path.string() + "' -f " + coder + " -c:a pcm_" + coder + " -");
}

TEST_P(LosslessRoundTrip, IsBitExactInEveryShape) {
    const SFormatCase& format = GetParam();
    for (int bytes : format.widths) {
        for (int channels : format.channels) {
            SCOPED_TRACE(std::to_string(bytes) + " bytes, " + std::to_string(channels) + " channels");
            const SShape shape{44100, channels, bytes};
            const std::string pcm = makeMusic(shape, kFrames);
            const auto path = folder / ("x." + std::string(format.extension));
            P<IAudioFormat> target = makeFormat(path, shape);
            ASSERT_TRUE(target);
            const int64_t estimate = target->getEstimatedSizeBytes(kFrames / 44100.0);
            writeAll(target, pcm, shape);
            const auto size = static_cast<int64_t>(std::filesystem::file_size(path));
            if (format.exactEstimate) {
                EXPECT_EQ(estimate, size);
            }

            P<IAudioSource> source = openSource(path, shape);
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
            EXPECT_TRUE(readByPeer(path, bytes) == pcm) << "another program reads something else";
            if (*format.check) run(std::string(format.check) + " '" + path.string() + "'");
        }
    }
}

// The host writes under a temporary name; the final name decides the container.
TEST_P(RoundTrip, TemporaryName_DoesNotChangeTheContainer) {
    const std::string extension = GetParam().extension;
    handler->setURISuffix("part");
    const SShape shape{44100, 2, GetParam().widths.back()};
    const std::string pcm = makeMusic(shape, 5000);
    const auto path = folder / ("x.y." + extension + "part");
    writeFile(path, pcm, shape);
    EXPECT_EQ(GetParam().magic, readFile(path).substr(0, std::strlen(GetParam().magic)));
    // The same with a dot in between, which only the plug-in itself has to handle.
    for (int i = 0; i < handler->getPluginCount(); ++i) {
        if (!handler->getPlugin(i)->getPluginName()->equals(GetParam().plugin)) continue;
        sonora2::common::ISonoraPlugin::SFormatParams params;
        params.nSampleRate = shape.rate;
        params.nChannelCount = shape.channels;
        params.nBytesPerSample = shape.bytes;
        const auto pointed = folder / ("x." + extension + ".part");
        P<IAudioFormat> format(handler->getPlugin(i)->tryCreateFormat(
            toURI(pointed), sonora2::common::kAudioFormat, true, &params));
        ASSERT_TRUE(format);
        writeAll(format, pcm, shape);
        if (GetParam().lossless) {
            EXPECT_TRUE(readFile(pointed) == readFile(path));
        } else { // some files contain a random serial number
            EXPECT_EQ(readFile(path).size(), readFile(pointed).size());
        }
    }
}

TEST_P(RoundTrip, StoppedInTheMiddle_LeavesAValidFile) {
    const SShape shape;
    const auto path = folder / ("x." + std::string(GetParam().extension));
    for (const std::string& pcm : {std::string(), makeMusic(shape, 20000)}) {
        {
            P<IAudioFormat> format = makeFormat(path, shape);
            format->open();
            if (!pcm.empty()) format->writeAudioChunk(makeChunk(pcm));
            // Released without close(), as happens when an exception leaves the encoder.
        }
        if (*GetParam().check) run(std::string(GetParam().check) + " '" + path.string() + "'");
        P<IAudioSource> source = openSource(path, shape);
        ASSERT_TRUE(source);
        const std::string played = readAll(source);
        EXPECT_TRUE(GetParam().lossless ? played == pcm : played.empty() == pcm.empty());
    }
}

INSTANTIATE_TEST_SUITE_P(Formats, RoundTrip, ::testing::ValuesIn(kFormatCases), printName);
INSTANTIATE_TEST_SUITE_P(Formats, LosslessRoundTrip, ::testing::ValuesIn(getLosslessCases()), printName);

struct SPeerFile {
    const char* name;
    const char* command; // makes the file from in.wav, 24 bit stereo
    int bytes;           // bytes per sample to expect
    bool exact;          // the samples equal those decoded by ffmpeg
    const char* codec = "PCM signed 16 bit";
};

class PeerFile : public CPluginTest, public ::testing::WithParamInterface<SPeerFile> {};

TEST_P(PeerFile, IsReadAsItsOwnProgramReadsIt) {
    const SPeerFile& file = GetParam();
    const SShape shape{44100, 2, 3};
    writeFile(folder / "in.wav", makeMusic(shape, 20011), shape);
    run("cd '" + folder.path().string() + "' && " + file.command);
    P<IAudioSource> source = openSource(folder / file.name, {44100, 2, file.bytes});
    ASSERT_TRUE(source);
    const std::string pcm = readAll(source);
    ASSERT_EQ(20011u * 2 * file.bytes, pcm.size());
    EXPECT_EQ(file.codec, codecOf(source));
    if (file.exact) {
        EXPECT_TRUE(pcm == readByPeer(folder / file.name, file.bytes));
    }
}

INSTANTIATE_TEST_SUITE_P(
    Files, PeerFile,
    ::testing::Values(
        SPeerFile{"a.wav", "ffmpeg -v error -i in.wav -c:a pcm_u8 a.wav", 1, true, "PCM unsigned 8 bit"},
        SPeerFile{"c.wav", "ffmpeg -v error -i in.wav -c:a pcm_f32le c.wav", 4, true, "PCM float 32 bit"},
        SPeerFile{"d.wav", "ffmpeg -v error -i in.wav -c:a pcm_f64le d.wav", 4, true, "PCM float 64 bit"},
        SPeerFile{"f.wav", "ffmpeg -v error -i in.wav -c:a pcm_s16le -rf64 always f.wav", 2, true},
        SPeerFile{"stream.wav", "ffmpeg -v error -i in.wav -f wav -c:a pcm_s16le - > stream.wav", 2, true},
        SPeerFile{"g.aiff", "sox in.wav -b 8 -D g.aiff", 1, true, "PCM signed 8 bit"},
        SPeerFile{"i.caf", "ffmpeg -v error -i in.wav -c:a pcm_s24be i.caf", 3, true, "PCM signed 24 bit"},
        SPeerFile{"j.w64", "sox in.wav -b 16 -D j.w64", 2, true},
        SPeerFile{"k.snd", "ffmpeg -v error -i in.wav -f au -c:a pcm_s16be k.snd", 2, true},
        SPeerFile{"l.flac", "flac -s8 in.wav -o l.flac", 3, true, "FLAC"},
        // Written to a pipe: the header has neither length nor checksum.
        SPeerFile{"n.flac", "flac -sc in.wav | cat > n.flac", 3, true, "FLAC"},
        SPeerFile{"tagged.flac",
                  "flac -s in.wav -o tagged.flac && head -c 300 /dev/zero | tr '\\0' T >> tagged.flac", 3,
                  false, "FLAC"}),
    [](const auto& row) {
        std::string name = row.param.name;
        std::ranges::replace(name, '.', '_');
        return name;
    });

TEST_F(CPluginTest, FlacSettings_AreThoseOfItsOwnEncoder) {
    const SShape shape;
    const std::string pcm = makeMusic(shape, 44100 * 35);
    const std::string in = (folder / "in.wav").string();
    writeFile(in, pcm, shape);
    for (int level : {-1, 0, 5, 8}) { // -1: none was set
        const auto ours = folder / ("ours" + std::to_string(level) + ".flac");
        P<IAudioFormat> format = makeFormat(ours, shape);
        if (level >= 0) format->setAudioQuality(level / 8.0);
        writeAll(format, pcm, shape);
        const std::string theirs = (folder / "theirs.flac").string();
        run("flac -sf" + std::to_string(level < 0 ? 5 : level) + " '" + in + "' -o '" + theirs + "'");
        const auto frames = [](const std::string& file) {
            const std::string copy = file + ".bare.flac";
            std::filesystem::copy_file(file, copy, std::filesystem::copy_options::overwrite_existing);
            run("metaflac --remove-all --dont-use-padding '" + copy + "'");
            // Only the marker, stream information and possibly a vendor string remain before the frames.
            return readFile(copy);
        };
        EXPECT_TRUE(frames(ours.string()) == frames(theirs)) << "level " << level;
        EXPECT_EQ(run("metaflac --show-md5sum '" + theirs + "'"),
                  run("metaflac --show-md5sum '" + ours.string() + "'"));
        const auto points = [](const std::string& file) {
            const std::string table = run("metaflac --list --block-type=SEEKTABLE '" + file + "'");
            const size_t first = table.find("point 0");
            return table.substr(first, table.find('\n', table.find("point 3")) - first);
        };
        EXPECT_EQ(points(theirs), points(ours.string())) << "level " << level;
    }
}

} // namespace

} // namespace tests
