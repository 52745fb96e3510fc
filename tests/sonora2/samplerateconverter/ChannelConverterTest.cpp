#include "sonora2/samplerateconverter/ChannelConverters.h"

#include <gtest/gtest.h>

#include <random>
#include <set>
#include <vector>

namespace {

using CChannelConverter = sonora2::samplerateconverter::CSampleRateConverter::CChannelConverter;
using sonora2::samplerateconverter::CSampleRateConverter;

// Weights of the six source channels and a divisor; divisor 0: the plane is not written.
struct SMix {
    int plane;
    std::array<int, 6> weights;
    int divisor;
};
struct SMatrix {
    int sourceChannels, destinationChannels;
    std::vector<SMix> mixes;
};

const std::vector<SMatrix>& matrices() {
    static const std::vector<SMatrix> all = {
        {1, 1, {{0, {1}, 1}}},
        {1, 2, {{0, {1}, 1}, {1, {1}, 1}}},
        {1, 3, {{2, {1}, 1}}},
        {1, 6, {{2, {1}, 1}}},
        {2, 1, {{0, {1, 1}, 2}}},
        {2, 2, {{0, {1}, 1}, {1, {0, 1}, 1}}},
        {2, 3, {{0, {1}, 1}, {1, {0, 1}, 1}, {2, {0, 6}, 8}}},
        {2, 6, {{0, {1}, 1}, {1, {0, 1}, 1}, {2, {0, 6}, 8}, {3, {1}, 2}, {4, {0, 1}, 2}}},
        {3, 1, {{0, {1, 1, 2}, 4}}},
        {3, 2, {{0, {3, 0, 2}, 5}, {1, {0, 3, 2}, 5}}},
        {3, 3, {{0, {1}, 1}, {1, {0, 1}, 1}, {2, {0, 0, 1}, 1}}},
        {3, 6, {{0, {1}, 1}, {1, {0, 1}, 1}, {2, {0, 0, 1}, 1}, {3, {1}, 2}, {4, {0, 1}, 2}}},
        {4, 2, {{0, {8, 0, 2}, 10}, {1, {0, 8, 0, 2}, 10}}},
        {6, 1, {{0, {2, 2, 4, 1, 1}, 10}}},
        {6, 2, {{0, {6, 0, 4}, 10}, {1, {0, 6, 4}, 10}}},
        {6, 3, {{0, {4, 0, 0, 0, 1}, 5}, {1, {0, 4, 0, 0, 0, 1}, 5}, {2, {0, 0, 1}, 1}}},
        {6,
         6,
         {{0, {1}, 1},
          {1, {0, 1}, 1},
          {2, {0, 0, 1}, 1},
          {3, {0, 0, 1}, 1},
          {4, {0, 0, 1}, 1},
          {5, {0, 0, 1}, 1}}},
    };
    return all;
}

// Random frames and the ends of the range, which reveal overflow and the rounding of divisions.
std::vector<int16_t> makeFrames(int channels, int frames) {
    std::mt19937 random(static_cast<unsigned>(channels * 31 + frames));
    const int16_t edges[] = {-32768, 32767, -1, 1, 0, -32767, 9, -9};
    std::vector<int16_t> samples(static_cast<size_t>(channels) * frames);
    for (size_t i = 0; i < samples.size(); ++i)
        samples[i] = i % 3 == 0 ? edges[random() % 8] : static_cast<int16_t>(random());
    return samples;
}

// The same mixes with 32 bits: the lower half of a sample carries the inverted upper one.
void expectWide(const CChannelConverter& converter, const SMatrix& matrix, const std::vector<int16_t>& narrow,
                int frames) {
    std::vector<int32_t> input(narrow.size());
    for (size_t i = 0; i < input.size(); ++i) input[i] = narrow[i] * 65536 + (narrow[i] ^ 0xffff) % 65536;
    std::vector<std::vector<int32_t>> planes(6, std::vector<int32_t>(static_cast<size_t>(frames), 77));
    std::vector<std::vector<int32_t>> expected = planes;
    for (const SMix& mix : matrix.mixes)
        for (int i = 0; i < frames; ++i) {
            int64_t sum = 0;
            for (int c = 0; c < matrix.sourceChannels; ++c)
                sum += int64_t{mix.weights[c]} * input[static_cast<size_t>(i) * matrix.sourceChannels + c];
            expected[mix.plane][i] = static_cast<int32_t>(sum / mix.divisor);
        }
    CChannelConverter::WidePlanePointers targets{};
    for (int p = 0; p < 6; ++p) targets[p] = planes[p].data();
    converter.convertWide(frames, input.data(), targets);
    EXPECT_EQ(planes, expected);
}

TEST(ChannelConverter, MixesAsTheMatricesSay) {
    constexpr int16_t kUntouched = 0x5a5a;
    for (const SMatrix& matrix : matrices())
        for (const int frames : {0, 1, 7, 8, 1000, 1003})
            for (const int padding : {0, 1, 5}) { // samples between the frames
                SCOPED_TRACE(testing::Message() << matrix.sourceChannels << " -> "
                                                << matrix.destinationChannels << ", " << frames << " frames");
                const int step = matrix.sourceChannels + padding;
                const std::vector<int16_t> input = makeFrames(step, frames);
                const auto converter =
                    CChannelConverter::create(matrix.sourceChannels, matrix.destinationChannels);
                ASSERT_TRUE(converter);

                // The sample after the last requested one must stay unchanged.
                std::vector<std::vector<int16_t>> planes(
                    6, std::vector<int16_t>(static_cast<size_t>(frames) + 1, kUntouched));
                std::vector<std::vector<int16_t>> expected = planes;
                std::vector<bool> written(6, false);
                for (const SMix& mix : matrix.mixes) {
                    written[mix.plane] = true;
                    for (int i = 0; i < frames; ++i) {
                        int sum = 0;
                        for (int c = 0; c < matrix.sourceChannels; ++c)
                            sum += mix.weights[c] * input[static_cast<size_t>(i) * step + c];
                        expected[mix.plane][i] = static_cast<int16_t>(sum / mix.divisor);
                    }
                }

                CChannelConverter::SourcePointers source{};
                CChannelConverter::PlanePointers targets{};
                for (int c = 0; c < matrix.sourceChannels; ++c) source[c] = input.data() + c;
                for (int p = 0; p < matrix.destinationChannels; ++p) targets[p] = planes[p].data();
                converter->convert(frames, source, step * 2, targets);
                EXPECT_EQ(planes, expected);
                if (padding == 0) expectWide(*converter, matrix, input, frames);
                for (int p = 0; p < matrix.destinationChannels; ++p)
                    EXPECT_EQ(converter->isPlaneWritten(p), written[p]) << p;
            }
}

TEST(ChannelConverter, KnowsTheLayoutsOfTheTableAndNoOthers) {
    std::set<std::pair<int, int>> known;
    for (const SMatrix& matrix : matrices())
        known.insert({matrix.sourceChannels, matrix.destinationChannels});
    EXPECT_EQ(known.size(), 17u);
    for (int source = -1; source <= 9; ++source)
        for (int destination = -1; destination <= 9; ++destination) {
            const bool expected = known.count({source, destination}) > 0;
            EXPECT_EQ(CSampleRateConverter::canConvert(source, destination), expected)
                << source << " -> " << destination;
            EXPECT_EQ(static_cast<bool>(CChannelConverter::create(source, destination)), expected);
        }
}

} // namespace
