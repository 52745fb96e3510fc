#include "peru/media/Samples.h"

#include <gtest/gtest.h>

#include <vector>

using namespace peru::media;

namespace {

// Packed little-endian samples.
std::vector<uint8_t> pack(const std::vector<int32_t>& samples, int32_t bytesPerSample) {
    std::vector<uint8_t> bytes;
    for (int32_t sample : samples)
        for (int32_t i = 0; i < bytesPerSample; ++i) bytes.push_back(static_cast<uint8_t>(sample >> (8 * i)));
    return bytes;
}

} // namespace

TEST(Samples_Scale, RoundsAndStaysInRange) {
    struct SCase {
        int32_t bytesPerSample;
        double gain;
        std::vector<int32_t> samples;
        std::vector<int32_t> expected;
    };
    const SCase cases[] = {
        {1, 0.5, {0, 1, -1, 127, -128, 5}, {0, 1, -1, 64, -64, 3}},
        {1, 2.0, {63, 64, -64, -65}, {126, 127, -128, -128}},
        {2, 0.5, {0, 1, -1, 32767, -32768, 3}, {0, 1, -1, 16384, -16384, 2}},
        {2, 1.5, {30000, -30000, 21845, -21845}, {32767, -32768, 32767, -32768}},
        {2, -1.0, {-32768, 32767}, {32767, -32767}},
        {2, 1e300, {1, -1, 0}, {32767, -32768, 0}},
        {2, 0.0, {32767, -32768}, {0, 0}},
        {3, 0.5, {-2, 0x400000, -8388608, 255, 256}, {-1, 0x200000, -4194304, 128, 128}},
        {3, 3.0, {8388607, -8388608, -1, 0x1234}, {8388607, -8388608, -3, 0x369C}},
        {2, 1.0, {-32768, -1, 0, 32767}, {-32768, -1, 0, 32767}},
        {3, 1.0, {-8388608, -1, 8388607}, {-8388608, -1, 8388607}},
        {4, 0.5, {1000}, {1000}}, // a width that no device has
    };
    for (const SCase& each : cases) {
        std::vector<uint8_t> bytes = pack(each.samples, each.bytesPerSample);
        scaleSamples(bytes.data(), static_cast<int64_t>(bytes.size()), each.bytesPerSample, each.gain);
        EXPECT_EQ(bytes, pack(each.expected, each.bytesPerSample))
            << each.bytesPerSample << " bytes times " << each.gain;
    }
}

TEST(Samples_ReadLevels, MeasuresTheFirstFrame) {
    struct SCase {
        int32_t bytesPerSample;
        int32_t channelCount;
        std::vector<int32_t> frame;
        double left;
        double right;
    };
    const SCase cases[] = {
        {1, 1, {-127}, 1.0, 1.0},
        {1, 2, {-128, 0}, 1.0, 0.0}, // one step beyond full level counts as full level
        {2, 2, {-32767, 16384}, 1.0, 16384 / 32767.0},
        {2, 1, {-16384, 32767}, 16384 / 32767.0, 16384 / 32767.0},
        {3, 2, {8388607, 8388607}, 0.0, 0.0},
        {4, 2, {1 << 30, INT32_MIN}, (1 << 30) / 2147483647.0, 1.0},
    };
    for (const SCase& each : cases) {
        const std::vector<uint8_t> bytes = pack(each.frame, each.bytesPerSample);
        const std::optional<SLevels> levels =
            readLevels(bytes.data(), each.bytesPerSample, each.channelCount);
        ASSERT_TRUE(levels);
        EXPECT_DOUBLE_EQ(levels->left, each.left) << each.bytesPerSample;
        EXPECT_DOUBLE_EQ(levels->right, each.right) << each.bytesPerSample;
    }
    EXPECT_FALSE(readLevels(nullptr, 2, 3));
    EXPECT_FALSE(readLevels(nullptr, 2, 0));
}
