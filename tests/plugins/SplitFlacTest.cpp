// FLAC files that several threads have encoded.
#include "peru/threads/ThreadBudget.h"
#include "plugins/PluginFixture.h"
#include "sonora2/media/IDiscardable.h"

#include <thread>

namespace tests {

namespace {

// Restores the budget of the process.
class SplitFlac : public CPluginTest {
protected:
    ~SplitFlac() override { peru::getThreadBudget().setLimit(m_limit); }

    // Noise of changing volume: frames of every size, and blocks of silence.
    std::string makeNoise(size_t size) {
        std::string pcm(size, '\0');
        for (size_t at = 0; at < size;) {
            const size_t end = std::min(size, at + random() % 40000);
            for (const int mask = (1 << random() % 9) - 1; at < end; ++at)
                pcm[at] = static_cast<char>(random() & mask);
        }
        return pcm;
    }
    std::string encode(const std::string& pcm, const SShape& shape, int level, int threads) {
        peru::getThreadBudget().setLimit(threads);
        const auto path = folder / ("x" + std::to_string(threads) + ".flac");
        std::filesystem::remove(path);
        const P<IAudioFormat> format = makeFormat(path, shape);
        format->setAudioQuality(level / 8.0);
        writeAll(format, pcm, shape);
        return readFile(path);
    }

    std::mt19937 random{5};

private:
    const int m_limit = peru::getThreadBudget().getLimit();
};

TEST_F(SplitFlac, EqualsTheFileOfASingleEncoder) {
    const char* wanted = std::getenv("TEST_FLAC_SHAPES"); // see scripts/parallel-flac.sh
    const int shapes = wanted ? std::atoi(wanted) : 27;
    for (int i = 0; i < shapes; ++i) {
        // Most of these stand in the frame headers themselves, in fields of different length.
        static constexpr int kRates[] = {44100, 7200, 96000, 655350, 12345};
        const SShape shape{kRates[random() % 5], static_cast<int>(random() % 8) + 1,
                           static_cast<int>(random() % 4) + 1};
        const int level = i % 9, block = (level < 3 ? 1152 : 4096) * shape.frameBytes();
        const size_t runBytes =
            static_cast<size_t>(524288 / block) * block; // what one thread encodes at a time
        // At, just beside and far from the borders of blocks and runs, and so short that no thread starts.
        size_t size = runBytes * (random() % 5) + block * (random() % 3) + random() % 3 * shape.frameBytes();
        if (i % 3 == 0) size += random() % block;
        const std::string pcm = makeNoise(size / shape.frameBytes() * shape.frameBytes());
        SCOPED_TRACE(std::to_string(shape.rate) + " Hz, " + std::to_string(shape.channels) + " channels, " +
                     std::to_string(shape.bytes) + " bytes, level " + std::to_string(level) + ", " +
                     std::to_string(pcm.size()));
        const std::string split = encode(pcm, shape, level, 8);
        ASSERT_TRUE(split == encode(pcm, shape, level, 1));
        if (i % 9 == 8) {
            run("flac -t -s x8.flac");
        }
    }
}

// Each of many jobs uses what the others leave, and closing one early leaves none waiting.
TEST_F(SplitFlac, JobsAtOnceShareTheThreads) {
    const std::string pcm = makeNoise(3000000), expected = encode(pcm, {}, 5, 1);
    peru::getThreadBudget().setLimit(3);
    std::vector<std::thread> jobs;
    std::vector<std::string> failures(4);
    for (int job = 0; job < 4; ++job)
        jobs.emplace_back([&, job] {
            const auto path = folder / (std::to_string(job) + ".flac");
            for (int round = 0; round < 2; ++round) {
                const P<IAudioFormat> format = makeFormat(path);
                writeAll(format, pcm);
                if (readFile(path) != expected) failures[job] = "differs";
                format->open();
                format->writeAudioChunk(makeChunk(pcm));
                peru::interfaceCast<sonora2::common::IDiscardable>(format)->discard();
            }
        });
    for (std::thread& job : jobs) job.join();
    EXPECT_EQ(std::vector<std::string>(4), failures);
    // Every share of the budget has been returned.
    for (int i = 0; i < 3; ++i) EXPECT_TRUE(peru::getThreadBudget().tryEnter());
    EXPECT_FALSE(peru::getThreadBudget().tryEnter());
    for (int i = 0; i < 3; ++i) peru::getThreadBudget().leave();
}

} // namespace

} // namespace tests
