// Waveforms of files, which several threads read.
#include "Library.h"
#include "peru/threads/ThreadBudget.h"
#include "sonora2/media/ITwinSource.h"

#include <cstring>
#include <fstream>
#include <tuple>

namespace {

using namespace tests;
namespace fs = std::filesystem;

constexpr int64_t kFrames = 1100000; // a few parts
constexpr int kStep = 22, kBlockFrames = 100 * kStep;
constexpr double kRate = 44100.0;

struct SBlocks {
    uint8_t result = 0;
    std::vector<float> samples;
    std::vector<double> fractions;
    size_t most = SIZE_MAX; // blocks
};

bool collectBlock(TONEWRIGHT_Handle, double fraction, const float* samples, int32_t count, void* user) {
    auto& blocks = *static_cast<SBlocks*>(user);
    blocks.samples.insert(blocks.samples.end(), samples, samples + count);
    blocks.fractions.push_back(fraction);
    return blocks.fractions.size() < blocks.most;
}

class StepReader : public testing::TestWithParam<const char*> {
protected:
    void SetUp() override {
        ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK);
        m_uri = uriOf(m_path);
        const CHandle format(TONEWRIGHT_CreateAudioFormatFromURI(m_uri.c_str(), 44100, 2, 2, 0.0, 0, 0, 0));
        SFakeSource script{.rate = 44100, .frames = kFrames, .chunkFrames = 44100};
        const CHandle source = wrap(peru::make<CFakeSource>(script));
        const CHandle encoder(TONEWRIGHT_CreateAudioEncoder(source.get(), format.get()));
        ASSERT_EQ(TONEWRIGHT_AudioEncoder_Encode(encoder.get()), TONEWRIGHT_OK);
    }
    void TearDown() override {
        peru::getThreadBudget().setLimit(m_limit);
        TONEWRIGHT_DeInitAll();
    }
    CHandle open() const {
        return CHandle(TONEWRIGHT_CreateAudioSourceFromURI(m_uri.c_str(), 44100, 2, 2, 1));
    }
    static SBlocks fetch(const CHandle& source, int threads, size_t most = SIZE_MAX) {
        peru::getThreadBudget().setLimit(threads);
        SBlocks blocks;
        blocks.most = most;
        blocks.result = TONEWRIGHT_AudioSource_FetchStreamSamples(source.get(), collectBlock,
                                                                  (kStep + 0.5) / kRate, &blocks);
        return blocks;
    }
    // The blocks of what can be read from a frame on, in one run.
    SBlocks expect(int64_t start) const {
        const CHandle handle = open();
        const auto source = behind<sonora2::common::IAudioSource>(handle);
        source->skipToTime(static_cast<double>(start) / kRate);
        std::vector<int16_t> pcm;
        SBlocks blocks;
        try {
            while (const auto chunk = source->getNextAudioChunk()) {
                const size_t known = pcm.size();
                pcm.resize(known + chunk->getSize() / 2);
                std::memcpy(&pcm[known], chunk->getData(), chunk->getSize());
            }
            blocks.result = 1;
        } catch (const peru::CException&) {
            pcm.resize(pcm.size() / 2 / kBlockFrames * kBlockFrames * 2); // an incomplete step does not count
        }
        const size_t steps = (pcm.size() / 2 + kStep - 1) / kStep / 100 * 100;
        for (size_t step = 0; step < steps; ++step) {
            for (size_t i = 0; i < 2; ++i)
                blocks.samples.push_back(static_cast<float>(pcm[step * kStep * 2 + i]) / 32768.0f);
            if (step % 100 == 99)
                blocks.fractions.push_back(static_cast<double>(step * kStep) / kRate / source->getDuration());
        }
        return blocks;
    }
    static void compare(const SBlocks& expected, const SBlocks& blocks) {
        EXPECT_EQ(expected.result, blocks.result);
        EXPECT_EQ(expected.fractions, blocks.fractions);
        EXPECT_TRUE(expected.samples == blocks.samples);
    }

    CTempFolder m_folder;
    const fs::path m_path = m_folder / ("x." + std::string(GetParam()));
    const int m_limit = peru::getThreadBudget().getLimit();
    std::u16string m_uri;
};

TEST_P(StepReader, AnyNumberOfThreads_DeliversWhatOneRunDoes) {
    for (const int64_t start : {0, 100001}) {
        const SBlocks expected = expect(start);
        ASSERT_GT(expected.fractions.size(), 400u);
        for (const int threads : start == 0 ? std::vector{1, 2, 8} : std::vector{8}) {
            SCOPED_TRACE(threads);
            const CHandle source = open();
            behind<sonora2::common::ISource>(source)->skipToTime(static_cast<double>(start) / kRate);
            compare(expected, fetch(source, threads));
            EXPECT_TRUE(behind<sonora2::common::ISource>(source)->isEOF());
        }
    }
    // Stopped by the host.
    const CHandle source = open();
    const SBlocks some = fetch(source, 8, 300);
    EXPECT_EQ(std::tuple(0, 300u), std::tuple(some.result, some.fractions.size()));
    EXPECT_EQ(300 * kBlockFrames, behind<sonora2::common::ITwinSource>(source)->getFrame());
    EXPECT_EQ(0, fetch(source, 8, 1).result);
}

TEST_P(StepReader, DamagedFile_DeliversTheSameBeforeItFails) {
    const auto size = static_cast<int64_t>(fs::file_size(m_path));
    for (const int64_t damage : {size * 9 / 10, size / 2, size / 10}) {
        std::fstream file(m_path, std::ios::in | std::ios::out | std::ios::binary);
        file.seekp(damage);
        file.write(std::string(3000, '\x55').data(), 3000);
        file.close();
        const SBlocks expected = expect(0);
        for (const int threads : {1, 8}) compare(expected, fetch(open(), threads));
    }
}

INSTANTIATE_TEST_SUITE_P(Files, StepReader, testing::Values("flac", "wav", "mp3"),
                         [](const auto& file) { return std::string(file.param); });

} // namespace
