// Damaged files and full disks.
#include "plugins/PluginFixture.h"

#include "sonora2/context/SonoraError.h"

#include <unistd.h>

namespace tests {

namespace {

using sonora2::common::CSonoraError;

// Returns what a source delivers before its end or failure; the failure's text is stored in `error`.
std::string readUntilError(const P<IAudioSource>& source, std::string& error) {
    std::string got;
    try {
        while (P<sonora2::audio::IAudioChunk> chunk = source->getNextAudioChunk())
            got.append(reinterpret_cast<const char*>(chunk->getData()), chunk->getSize());
    } catch (const CSonoraError& failure) {
        error = text(failure.getDescription());
    }
    return got;
}

class Failure : public CPluginTest, public ::testing::WithParamInterface<SFormatCase> {
protected:
    static constexpr int kFrames = 40009;

    std::filesystem::path named(const std::string& name) {
        return folder / (name + "." + GetParam().extension);
    }
    // Reads a damaged file, which must end before delivering more than it could possibly hold.
    void survive(const std::filesystem::path& path, const std::string& what) {
        SCOPED_TRACE(what);
        P<IAudioSource> source = openSource(path, {});
        if (!source) source = openSource(path, {48000, 1, 2}); // the damage may have changed the shape
        if (!source) return;
        try {
            const size_t limit = 64 << 20;
            EXPECT_LT(readAll(source, limit).size(), limit) << "no end";
            source->skipToTime(source->getDuration() / 2);
            readAll(source, limit);
        } catch (const peru::CException& error) {
            EXPECT_FALSE(error.getDescription()->isEmpty());
            EXPECT_TRUE(source->isEOF());
        }
    }
};

TEST_P(Failure, TruncatedFile_EndsWithWhatIsThere) {
    const SShape shape;
    const std::string pcm = makeMusic(shape, kFrames);
    writeFile(named("whole"), pcm, shape);
    const std::string whole = readFile(named("whole"));
    for (int i = 0; i < 20; ++i) {
        const size_t size = i < 10 ? static_cast<size_t>(i) * 13 : whole.size() * (i - 9) / 11;
        const auto path = folder.write(named("cut").filename().string(), whole.substr(0, size));
        survive(path, "cut at " + std::to_string(size));
    }
    if (!GetParam().lossless) return;
    // The sound before the cut is delivered.
    const auto path = folder.write(named("cut").filename().string(), whole.substr(0, whole.size() / 2));
    P<IAudioSource> source = openSource(path, shape);
    if (!source) return; // refusing the whole file is also acceptable
    std::string error;
    const std::string got = readUntilError(source, error);
    EXPECT_GT(got.size(), pcm.size() / 4);
    EXPECT_TRUE(pcm.compare(0, got.size(), got) == 0);
    if (GetParam().exactEstimate) {
        EXPECT_DOUBLE_EQ(got.size() / 4 / 44100.0, source->getDuration());
    }
}

TEST_P(Failure, FlippedBytes_NeverCrashOrHang) {
    const SShape shape;
    writeFile(named("whole"), makeMusic(shape, kFrames / 4), shape);
    const std::string whole = readFile(named("whole"));
    std::mt19937 random(11);
    for (int i = 0; i < 100; ++i) {
        std::string bad = whole;
        // Damage to headers has the worst effects.
        const size_t range = i % 2 ? whole.size() : std::min<size_t>(whole.size(), 128);
        const size_t at = random() % range;
        bad[at] = static_cast<char>(bad[at] ^ (1 + random() % 255));
        survive(folder.write(named("bad").filename().string(), bad), "byte " + std::to_string(at));
    }
}

TEST_P(Failure, FullDisk_IsToldByName) {
    const SShape shape;
    std::filesystem::create_symlink("/dev/full", named("full"));
    P<IAudioFormat> format = makeFormat(named("full"), shape);
    ASSERT_TRUE(format);
    // With few frames close() reports the error at the latest; with many, a write does, and later calls are
    // safe.
    for (int frames : {100, 3000000}) {
        bool told = false;
        try {
            format->open();
            const std::string pcm = makeMusic(shape, 50000);
            for (int done = 0; done < frames; done += 50000)
                format->writeAudioChunk(makeChunk(pcm.substr(0, std::min(frames, 50000) * 4)));
            format->close();
        } catch (const CSonoraError& error) {
            told = true;
            const std::string reason = text(error.getDescription());
            EXPECT_NE(std::string::npos, reason.find(named("full").string())) << reason;
            EXPECT_NE(std::string::npos, reason.find("No space left on device")) << reason;
        }
        EXPECT_TRUE(told);
        EXPECT_NO_THROW(format->close());
    }
}

TEST_P(Failure, TargetThatCannotBeMade_LeavesNothing) {
    const auto inside = folder / "missing" / named("x").filename();
    P<IAudioFormat> format = makeFormat(inside, {});
    ASSERT_TRUE(format);
    EXPECT_THROW(format->open(), CSonoraError);
    EXPECT_FALSE(format->isOpened());
    EXPECT_FALSE(std::filesystem::exists(folder / "missing"));
    std::filesystem::create_directory(named("folder"));
    EXPECT_THROW(makeFormat(named("folder"), {})->open(), CSonoraError);
    EXPECT_TRUE(std::filesystem::is_directory(named("folder")));
}

TEST_P(Failure, UseOutsideItsState_IsRefused) {
    const SShape shape;
    P<IAudioFormat> format = makeFormat(named("x"), shape);
    EXPECT_THROW(format->writeAudioChunk(makeChunk("abcd")), CSonoraError);
    EXPECT_THROW(format->setAudioQuality(std::nan("")), CSonoraError);
    EXPECT_THROW(format->setAudioBitRate(128000, 192000, 256000), CSonoraError);
    format->open();
    EXPECT_THROW(format->writeAudioChunk(makeChunk("abc")), CSonoraError) << "no whole frame";
    EXPECT_THROW(format->setAudioQuality(0.5), CSonoraError);
    format->close();
    P<IAudioSource> source = openSource(named("x"), shape);
    source->close();
    EXPECT_THROW(source->getNextAudioChunk(), CSonoraError);
    EXPECT_THROW(source->skipToTime(0.0), CSonoraError);
    EXPECT_TRUE(source->isEOF());
}

INSTANTIATE_TEST_SUITE_P(Formats, Failure, ::testing::ValuesIn(kFormatCases), printName);

// The read-ahead thread meets the damage; it is reported after the sound that precedes it.
TEST_F(CPluginTest, DamagedFlacFrame_IsAnErrorBehindTheValidPart) {
    const SShape shape;
    const std::string pcm = makeMusic(shape, 200000);
    writeFile(folder / "x.flac", pcm, shape);
    std::string bytes = readFile(folder / "x.flac");
    for (int i = 0; i < 40; ++i) bytes[bytes.size() * 3 / 4 + i] ^= 0x55;
    folder.write("x.flac", bytes);
    P<IAudioSource> source = openSource(folder / "x.flac", shape);
    std::string error;
    const std::string got = readUntilError(source, error);
    EXPECT_NE(std::string::npos, error.find("x.flac is damaged behind")) << error;
    EXPECT_GT(got.size(), pcm.size() / 2);
    EXPECT_LT(got.size(), pcm.size());
    EXPECT_TRUE(pcm.compare(0, got.size(), got) == 0);
    EXPECT_TRUE(source->isEOF());
    EXPECT_FALSE(source->getNextAudioChunk());
    source->skipToTime(1.0); // the intact part can still be read
    const std::string good = readAll(source, 1);
    EXPECT_FALSE(good.empty());
    EXPECT_TRUE(pcm.compare(44100 * 4, good.size(), good) == 0);
}

TEST_F(CPluginTest, RefusedShape_KeepsTheOldFile) {
    folder.write("x.flac", "dear to somebody");
    EXPECT_FALSE(makeFormat(folder / "x.flac", {44100, 9, 2}));
    EXPECT_FALSE(makeFormat(folder / "x.flac", {2000000, 2, 2}));
    P<IAudioFormat> format = makeFormat(folder / "x.flac", {});
    EXPECT_EQ("dear to somebody", readFile(folder / "x.flac"));
}

} // namespace

} // namespace tests
