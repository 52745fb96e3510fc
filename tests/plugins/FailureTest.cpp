// Damaged files, full disks, and jobs that are cut off.
#include "plugins/PluginFixture.h"

#include "peru/strings/StringFormat.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/IDiscardable.h"
#include "sonora2/media/ISalvage.h"

#include <chrono>
#include <csignal>
#include <sys/resource.h>
#include <thread>

namespace tests {

namespace {

using sonora2::common::CSonoraError;

// Returns what a source delivers before its end or failure; the failure's text is stored in `error`.
std::string readUntilError(const P<IAudioSource>& source, std::string& error) {
    std::string got;
    try {
        while (P<IAudioChunk> chunk = source->getNextAudioChunk())
            got.append(reinterpret_cast<const char*>(chunk->getData()), chunk->getSize());
    } catch (const CSonoraError& failure) {
        error = text(failure.getDescription());
    }
    return got;
}

class Failure : public CFormatTest {};

// Truncated and changed bytes must neither crash nor deliver more than the file could possibly hold.
TEST_P(Failure, DamagedFile_NeverCrashesOrHangs) {
    writeFile(named("whole"), makeMusic({}, 10000));
    const std::string whole = readFile(named("whole"));
    std::mt19937 random(11);
    for (int i = 0; i < 120; ++i) {
        std::string bad = whole;
        // Damage to headers has the worst effects.
        const size_t at = random() % (i % 2 ? whole.size() : std::min<size_t>(whole.size(), 128));
        if (i < 100)
            bad[at] = static_cast<char>(bad[at] ^ (1 + random() % 255));
        else
            bad.resize(at);
        SCOPED_TRACE(std::to_string(at) + " of " + std::to_string(bad.size()));
        const auto path = folder.write(named().filename().string(), bad);
        P<IAudioSource> source = openSource(path);
        if (!source) source = openSource(path, {48000, 1, 2}); // the damage may have changed the shape
        if (!source) continue;
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
}

TEST_P(Failure, TruncatedFile_EndsWithWhatIsThere) {
    if (!GetParam().lossless) return;
    const std::string pcm = makeMusic({}, 40009);
    writeFile(named(), pcm);
    std::filesystem::resize_file(named(), std::filesystem::file_size(named()) / 2);
    P<IAudioSource> source = openSource(named());
    ASSERT_TRUE(source);
    std::string error;
    const std::string got = readUntilError(source, error);
    EXPECT_GT(got.size(), pcm.size() / 4);
    EXPECT_TRUE(pcm.starts_with(got));
    EXPECT_EQ(GetParam().exactEstimate, error.empty()) << error;
    EXPECT_EQ(GetParam().exactEstimate, got.size() / 4 / 44100.0 == source->getDuration());
}

TEST_P(Failure, FullDisk_IsToldByName) {
    std::filesystem::create_symlink("/dev/full", named());
    P<IAudioFormat> format = makeFormat(named());
    const std::string pcm = makeMusic({}, 50000);
    // With few frames close() reports the error at the latest; with many, a write does.
    for (const auto& [size, count] : {std::pair{size_t{400}, 1}, std::pair{pcm.size(), 60}}) {
        const std::string reason = errorOf<CSonoraError>([&, size = size, count = count] {
            format->open();
            for (int i = 0; i < count; ++i) format->writeAudioChunk(makeChunk(pcm.substr(0, size)));
            format->close();
        });
        EXPECT_NE(std::string::npos, reason.find(named().string())) << reason;
        EXPECT_NE(std::string::npos, reason.find("No space left on device")) << reason;
        EXPECT_NO_THROW(format->close());
    }
}

TEST_P(Failure, GrowingBeyondALimit_KeepsTheOldFile) {
    folder.write(named().filename(), "dear to somebody");
    const auto old = std::signal(SIGXFSZ, SIG_IGN);
    rlimit own;
    getrlimit(RLIMIT_FSIZE, &own);
    const rlimit small{50'000, own.rlim_max};
    P<IAudioFormat> format = makeFormat(named());
    format->open();
    setrlimit(RLIMIT_FSIZE, &small);
    const auto write = [&, pcm = makeMusic({}, 200'000)] {
        while (true) format->writeAudioChunk(makeChunk(pcm));
    };
    const std::string error = errorOf<CSonoraError>(write), again = errorOf<CSonoraError>(write);
    setrlimit(RLIMIT_FSIZE, &own);
    std::signal(SIGXFSZ, old);
    EXPECT_EQ(0u, error.find("could not write " + named().string() + ": ")) << error;
    EXPECT_NE(std::string::npos, error.find("File too large")) << error;
    EXPECT_EQ(error, again);
    EXPECT_NO_THROW(format->close());
    EXPECT_EQ("dear to somebody", readFile(named()));
}

TEST_P(Failure, TargetThatBecomesAFolder_IsAnErrorAtTheEnd) {
    folder.write(named().filename(), "old");
    P<IAudioFormat> format = makeFormat(named());
    format->open();
    format->writeAudioChunk(makeChunk(makeMusic({}, 5000)));
    std::filesystem::remove(named());
    std::filesystem::create_directory(named());
    const std::string error = errorOf<CSonoraError>([&] { format->close(); });
    EXPECT_EQ(0u, error.find("could not write " + named().string() + ": ")) << error;
    EXPECT_EQ(1u, countEntries(folder.path()));
}

TEST_P(Failure, WhatIsNoReadableFile_IsRefusedWithTheReason) {
    const auto path = named().string();
    for (const auto& [command, reason] : {std::pair{"mkdir ", "Is a directory"},
                                          {"mkfifo ", "is not a file"},
                                          {"ln -s /proc/self/mem ", "could not "},
                                          {"ln -s x ", "No such file or directory"}}) {
        run("rm -rf " + path + " && " + command + path);
        log->lines.clear();
        EXPECT_FALSE(openSource(path));
        EXPECT_NE(std::string::npos, log->lines.at(0).find(path)) << log->lines[0];
        EXPECT_NE(std::string::npos, log->lines[0].find(reason)) << log->lines[0];
    }
}

TEST_P(Failure, TargetThatCannotBeMade_LeavesNothing) {
    P<IAudioFormat> format = makeFormat(folder / "missing" / named().filename());
    EXPECT_THROW(format->open(), CSonoraError);
    EXPECT_FALSE(format->isOpened());
    EXPECT_FALSE(std::filesystem::exists(folder / "missing"));
    std::filesystem::create_directory(named());
    EXPECT_THROW(makeFormat(named())->open(), CSonoraError);
    EXPECT_TRUE(std::filesystem::is_directory(named()));
}

TEST_P(Failure, UseOutsideItsState_IsRefused) {
    P<IAudioFormat> format = makeFormat(named());
    EXPECT_THROW(format->writeAudioChunk(makeChunk("abcd")), CSonoraError);
    EXPECT_THROW(format->setAudioQuality(std::nan("")), CSonoraError);
    EXPECT_THROW(format->setAudioBitRate(128000, 192000, 256000), CSonoraError);
    format->open();
    EXPECT_THROW(format->writeAudioChunk(makeChunk("abc")), CSonoraError) << "no whole frame";
    EXPECT_THROW(format->setAudioQuality(0.5), CSonoraError);
    format->close();
    P<IAudioSource> source = openSource(named());
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
        const auto path = folder / damage.name;
        writeFile(path, makeMusic({}, 200000));
        const std::string whole = read(path);
        std::string bytes = readFile(path);
        damage.apply(bytes);
        folder.write(damage.name, bytes);

        P<IAudioSource> source = openSource(path);
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
    writeFile(folder / "x.flac", makeMusic({}, 40000));
    std::string bytes = readFile(folder / "x.flac");
    folder.write("x.flac", bytes.replace(bytes.size() / 2, 40, 40, 'U'));
    P<IAudioSource> source = openSource(folder / "x.flac");
    source->getNextAudioChunk();
    while (source->getBufferStatus() < 100) std::this_thread::yield();
    EXPECT_THROW(readAll(source), CSonoraError);
}

TEST_F(CPluginTest, FileThatShrinks_IsAnError) {
    for (const auto& path : {folder / "x.wav", folder / "x.mp3"}) {
        writeFile(path, makeMusic({}, 800000));
        P<IAudioSource> source = openSource(path);
        source->getNextAudioChunk();
        std::filesystem::resize_file(path, std::filesystem::file_size(path) / 2);
        std::string error;
        EXPECT_GT(readUntilError(source, error).size(), 300000u * 4);
        EXPECT_NE(std::string::npos, error.find(" of 18.141 seconds")) << error;
    }
}

constexpr size_t kFlacBlocks = 42; // behind the stream information, where the seek table lies

TEST_F(CPluginTest, UnusualFlac_IsReadInFull) {
    const std::string pcm = makeMusic({}, 200000);
    writeFile(folder / "x.flac", pcm);
    const std::string plain = readFile(folder / "x.flac");
    const std::string tag = std::string("ID3\4\0\0\0\0\1\0", 10) + std::string(128, '\0');
    const std::string blocks("\1\0\0\2xx\2\0\0\4riff\1\0\0\0", 18);
    for (const std::string& file :
         {tag + tag + plain, std::string(1000, '\0') + plain + std::string(128, 'T'),
          std::string(plain).insert(kFlacBlocks, blocks),
          std::string(plain).replace(kFlacBlocks + 4, 36, 36, '\1')}) { // seek points that lead nowhere
        P<IAudioSource> source = openSource(folder.write("x.flac", file));
        ASSERT_TRUE(source);
        source->skipToTime(2.0);
        EXPECT_TRUE(readAll(source) == pcm.substr(88200 * 4));
        source->skipToTime(0.0);
        EXPECT_TRUE(readAll(source) == pcm);
    }
}

TEST_F(CPluginTest, FlacThatChangesItsRate_EndsThere) {
    const std::string pcm = makeMusic({}, 8192);
    writeFile(folder / "x.flac", pcm);
    writeFile(folder / "y.flac", pcm, {48000, 2, 2});
    const std::string second = readFile(folder / "y.flac");
    // Without a length in the header.
    const auto path = folder.write("x.flac", readFile(folder / "x.flac").replace(22, 4, 4, '\0') +
                                                 second.substr(second.find("\xFF\xF8")));
    std::string error;
    EXPECT_TRUE(readUntilError(openSource(path), error) == pcm);
    EXPECT_EQ(path.string() + " changes at 0.186 seconds from 44100 Hz, 2 channels, 16 bits to 48000 Hz, "
                              "2 channels, 16 bits, which is not supported",
              error);
}

TEST_F(CPluginTest, CutOffWriting_LeavesAFileThatPlaysUpToItsLastHalfSecond) {
    const std::string pcm = makeMusic({}, 2 * 44100);
    std::vector<P<IAudioFormat>> formats;
    for (const SFormatCase& row : kFormatCases) {
        formats.push_back(makeFormat(folder / ("x." + std::string(row.extension))));
        formats.back()->open();
    }
    // Sound arrives as slowly as in a recording. Codecs may still hold back some of it.
    std::this_thread::sleep_for(std::chrono::milliseconds(550));
    for (const P<IAudioFormat>& format : formats) format->writeAudioChunk(makeChunk(pcm));
    for (size_t i = 0; i < formats.size(); ++i) {
        const SFormatCase& row = kFormatCases[i];
        SCOPED_TRACE(row.extension);
        // sox relies on the sizes in the header, unlike other programs.
        const std::string name = "x." + std::string(row.extension);
        const bool isContainer = std::string(row.plugin) == "sonora2_wav";
        const std::string played =
            isContainer ? run("sox -t sndfile " + name + " -t raw -") : decodeByPeer(name);
        EXPECT_GT(played.size(), pcm.size() - pcm.size() / 6);
        EXPECT_TRUE(!row.lossless || pcm.starts_with(played));
        formats[i]->writeAudioChunk(makeChunk(pcm)); // continues normally
        formats[i]->close();
        const std::string whole = read(folder / name);
        EXPECT_GE(whole.size(), 2 * pcm.size());
        EXPECT_TRUE(!row.lossless || whole == pcm + pcm);
    }
}

TEST_F(CPluginTest, RefusedShape_StatesWhyAndKeepsTheOldFile) {
    const struct {
        const char* name;
        SShape shape;
        const char* reason;
    } refused[] = {
        {"x.flac", {44100, 9, 2}, "1 to 8 channels at up to 1048575 Hz, not 9 channels at 44100 Hz"},
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
        P<IAudioFormat> format = makeFormat(folder / row.name);
        EXPECT_EQ("dear to somebody", readFile(folder / row.name));
    }
}

TEST_F(CPluginTest, BitRateOutOfRange_IsRefusedWithoutAFile) {
    const struct {
        const char* name;
        int rate, channels, nominal, maximum;
        const char* reason; // empty: accepted
    } rows[] = {
        {"x.mp3", 44100, 2, 192, 0,
         "192 bit/s is below the range of MP3 for 44100 Hz and 2 channels, "
         "32000 to 320000 bit/s (192k?)"},
        {"x.mp3", 48000, 1, 31999, 0, "31999 bit/s is below"},
        {"x.mp3", 32000, 2, 32000, 320000, ""},
        {"x.mp3", 32000, 2, 32000, 320001, "320001 bit/s is above"},
        {"x.mp3", 24000, 2, 160000, 0, ""},
        {"x.mp3", 24000, 2, 192000, 0,
         "above the range of MP3 for 24000 Hz and 2 channels, 8000 to 160000 bit/s"},
        {"x.mp3", 12000, 2, 64000, 0, ""},
        {"x.mp3", 12000, 2, 64001, 0, "8000 to 64000 bit/s"},
        {"x.ogg", 44100, 2, 192, 0, "192 bit/s is below the range of Vorbis for 44100 Hz and 2 channels, "},
        {"x.ogg", 44100, 2, 192, 0, " bit/s (192k?)"},
        {"x.ogg", 8000, 1, 900000, 0,
         "900000 bit/s is above the range of Vorbis for 8000 Hz and 1 channels, "},
        {"x.ogg", 44100, 2, 128000, 160000, ""},
    };
    for (const auto& row : rows) {
        P<IAudioFormat> format = makeFormat(folder / row.name, {row.rate, row.channels, 2});
        format->setAudioBitRate(row.nominal, 0, row.maximum);
        if (!*row.reason) {
            EXPECT_NO_THROW(format->open()) << row.name << row.nominal;
            peru::interfaceCast<sonora2::common::IDiscardable>(format)->discard();
            continue;
        }
        const std::string error = errorOf([&] { format->open(); });
        EXPECT_NE(std::string::npos, error.find(row.reason)) << error;
        EXPECT_FALSE(std::filesystem::exists(folder / row.name));
    }
}

} // namespace

} // namespace tests
