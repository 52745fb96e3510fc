// Damaged files and full disks.
#include "plugins/PluginFixture.h"

#include "peru/strings/StringFormat.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/ISalvage.h"

#include <thread>

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

struct SDamage {
    const char* name;
    void (*apply)(std::string& file);
};

const SDamage kDamages[] = {
    {"overwritten.flac", [](std::string& file) { file.replace(file.size() * 3 / 4, 40, 40, 'U'); }},
    {"zeros.flac", [](std::string& file) { file.replace(file.size() / 2, 50000, 50000, '\0'); }},
    {"cut.flac", [](std::string& file) { file.erase(file.size() / 2, 50000); }},
    {"tail.flac", [](std::string& file) { file[file.size() - 20] ^= 0x55; }},
    {"zeros.ogg", [](std::string& file) { file.replace(file.size() / 2, 9000, 9000, '\0'); }},
};

// The read-ahead thread meets the damage, which is reported after the sound before it. With salvage, silence
// takes the place of what is damaged.
TEST_F(CPluginTest, DamagedSound_IsLocatedAndCanBeSalvaged) {
    for (const SDamage& damage : kDamages) {
        SCOPED_TRACE(damage.name);
        const SShape shape;
        const auto path = folder / damage.name;
        writeFile(path, makeMusic(shape, 200000), shape);
        const std::string whole = readAll(openSource(path, shape));
        std::string bytes = readFile(path);
        damage.apply(bytes);
        folder.write(damage.name, bytes);

        P<IAudioSource> source = openSource(path, shape);
        std::string error;
        const std::string good = readUntilError(source, error);
        const double at = static_cast<double>(good.size()) / 4 / 44100;
        EXPECT_EQ(0u, error.find(text(peru::format("%s is damaged at %.3f seconds", path.c_str(), at))))
            << error;
        EXPECT_TRUE(whole.starts_with(good) && good.size() > whole.size() / 3 && good.size() < whole.size());
        EXPECT_TRUE(source->isEOF());
        EXPECT_FALSE(source->getNextAudioChunk());
        const size_t before = good.size() / 4 - 2000; // a search for it may meet the damage
        source->skipToTime(static_cast<double>(before) / 44100);
        EXPECT_TRUE(good.substr(before * 4) == readUntilError(source, error));
        P<IAudioSource> converted = openSource(path, {48000, 1, 2});
        EXPECT_NEAR(at * 48000, static_cast<double>(readUntilError(converted, error).size() / 2), 0.6);

        log->lines.clear();
        peru::interfaceCast<sonora2::common::ISalvage>(source)->setSalvage(true);
        const std::string salvaged = readAll(source);
        ASSERT_EQ(whole.size(), salvaged.size());
        ASSERT_EQ(1u, log->lines.size());
        double from = 0.0, to = 0.0;
        std::sscanf(log->lines[0].c_str() + path.string().size(), " is damaged: %lf to %lf seconds", &from,
                    &to);
        EXPECT_NEAR(at, from, 0.0006) << log->lines[0];
        const auto end = static_cast<size_t>((to - 0.0006) * 44100) * 4; // the time is rounded
        EXPECT_TRUE(salvaged.starts_with(good));
        EXPECT_EQ(std::string::npos, salvaged.substr(good.size(), end - good.size()).find_first_not_of('\0'));
        const size_t settled = std::min(end + 2048 * 4, whole.size()); // blocks overlap
        EXPECT_TRUE(whole.substr(settled) == salvaged.substr(settled));
        const size_t inside = good.size() / 4 + 700;
        source->skipToTime(static_cast<double>(inside) / 44100);
        const std::string rest = readAll(source);
        EXPECT_TRUE(salvaged.substr(settled) == rest.substr(settled - inside * 4));
        EXPECT_EQ(salvaged.size() - inside * 4, rest.size());
    }
}

// A consumer that only asks for the end of the file learns about an error that is still queued.
TEST_F(CPluginTest, QueuedError_ComesBeforeTheEnd) {
    const SShape shape;
    writeFile(folder / "x.flac", makeMusic(shape, 40000), shape);
    std::string bytes = readFile(folder / "x.flac");
    folder.write("x.flac", bytes.replace(bytes.size() / 2, 40, 40, 'U'));
    P<IAudioSource> source = openSource(folder / "x.flac", shape);
    source->getNextAudioChunk();
    while (source->getBufferStatus() < 100) std::this_thread::yield();
    EXPECT_THROW(readAll(source), CSonoraError);
}

TEST_F(CPluginTest, FileThatShrinks_IsAnError) {
    for (const char* name : {"x.wav", "x.mp3"}) {
        const SShape shape;
        writeFile(folder / name, makeMusic(shape, 800000), shape);
        P<IAudioSource> source = openSource(folder / name, shape);
        source->getNextAudioChunk();
        std::filesystem::resize_file(folder / name, std::filesystem::file_size(folder / name) / 2);
        std::string error;
        EXPECT_GT(readUntilError(source, error).size(), 300000u * 4);
        EXPECT_NE(std::string::npos, error.find(" of 18.141 seconds")) << error;
    }
}

TEST_F(CPluginTest, UnusualFlac_IsReadInFull) {
    const SShape shape;
    const std::string pcm = makeMusic(shape, 200000);
    writeFile(folder / "x.flac", pcm, shape);
    const std::string plain = readFile(folder / "x.flac");
    const std::string tag = std::string("ID3\4\0\0\0\0\1\0", 10) + std::string(128, '\0');
    constexpr size_t kBlocks = 42; // behind the stream information, where the seek table lies
    const std::string blocks = std::string("\1\0\0\2xx\2\0\0\4riff\1\0\0\0", 18);
    const std::string files[] = {
        tag + tag + plain,
        std::string(1000, '\0') + plain + std::string(128, 'T'),
        std::string(plain).insert(kBlocks, blocks),
        // A seek table that leads nowhere.
        std::string(plain).replace(kBlocks + 4, 36, 36, '\1'),
    };
    for (const std::string& file : files) {
        folder.write("x.flac", file);
        P<IAudioSource> source = openSource(folder / "x.flac", shape);
        ASSERT_TRUE(source);
        source->skipToTime(2.0);
        EXPECT_TRUE(readAll(source) == pcm.substr(88200 * 4));
        source->skipToTime(0.0);
        EXPECT_TRUE(readAll(source) == pcm);
    }
}

TEST_F(CPluginTest, FlacThatChangesItsRate_EndsThere) {
    const SShape shape;
    const std::string pcm = makeMusic(shape, 8192);
    for (int rate : {44100, 48000}) {
        folder.write("x.raw", pcm);
        run("flac -sf --no-padding --no-seektable --force-raw-format --endian=little --sign=signed "
            "--channels=2 "
            "--bps=16 --sample-rate=" +
            std::to_string(rate) + " - < '" + (folder / "x.raw").string() + "' > '" +
            (folder / (std::to_string(rate) + ".flac")).string() + "'");
    }
    const std::string second = readFile(folder / "48000.flac");
    const auto path =
        folder.write("x.flac", readFile(folder / "44100.flac") + second.substr(second.find("\xFF\xF8")));
    P<IAudioSource> source = openSource(path, shape);
    std::string error;
    EXPECT_TRUE(readUntilError(source, error) == pcm);
    EXPECT_EQ(path.string() + " changes at 0.186 seconds from 44100 Hz, 2 channels, 16 bits to 48000 Hz, "
                              "2 channels, 16 bits, which is not supported",
              error);
}

TEST_F(CPluginTest, RefusedShape_StatesWhyAndKeepsTheOldFile) {
    const struct {
        const char* name;
        SShape shape;
        const char* reason;
    } refused[] = {
        {"x.flac",
         {44100, 9, 2},
         "FLAC files hold 1 to 8 channels at up to 1048575 Hz, not 9 channels at 44100 Hz"},
        {"x.flac", {2000000, 2, 2}, "not 2 channels at 2000000 Hz"},
        {"x.mp3", {96000, 2, 2}, "44.1 or 48 kHz, not 2 channels at 96000 Hz"},
        {"x.mp3", {44100, 3, 2}, "MP3 files hold 1 or 2 channels"},
        {"x.ogg", {250000, 2, 2}, "up to 200000 Hz, not 2 channels at 250000 Hz"},
        {"x.wav", {2000000000, 2, 2}, "WAV files hold"},
        {"x.aiff", {44100, 2000, 2}, ".aiff files hold up to 1024 channels"},
    };
    for (const auto& row : refused) {
        folder.write(row.name, "dear to somebody");
        log->lines.clear();
        EXPECT_FALSE(makeFormat(folder / row.name, row.shape));
        ASSERT_EQ(1u, log->lines.size());
        EXPECT_NE(std::string::npos, log->lines[0].find(row.reason)) << log->lines[0];
        P<IAudioFormat> format = makeFormat(folder / row.name, {});
        EXPECT_EQ("dear to somebody", readFile(folder / row.name));
    }
}

TEST_F(CPluginTest, BitRateThatIsTooLow_IsRefusedWithoutAFile) {
    for (const auto& [name, reason] :
         {std::pair{"x.mp3", "192 bits per second are too few, MP3 at 44100 Hz needs at least 32000"},
          std::pair{"x.ogg", "2 channels at 44100 Hz with a bit rate of 192 "}}) {
        P<IAudioFormat> format = makeFormat(folder / name, {});
        format->setAudioBitRate(192, 0, 0);
        const std::string error = errorOf([&] { format->open(); });
        EXPECT_NE(std::string::npos, error.find(reason)) << error;
        EXPECT_FALSE(std::filesystem::exists(folder / name));
    }
}

} // namespace

} // namespace tests
