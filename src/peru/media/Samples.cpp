#include "peru/media/Samples.h"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace peru::media {

namespace {

// The product, rounded half away from zero and clamped to the range of the width.
template <int32_t Bits> int32_t scale(int32_t sample, double gain) {
    constexpr double kMax = (int64_t{1} << (Bits - 1)) - 1;
    const double product = std::clamp(sample * gain, -kMax - 1.0, kMax);
    return static_cast<int32_t>(product + (product < 0.0 ? -0.5 : 0.5));
}

template <class T> void scaleAll(uint8_t* bytes, int64_t size, double gain) {
    for (int64_t i = 0; i + static_cast<int64_t>(sizeof(T)) <= size; i += sizeof(T)) {
        T sample;
        std::memcpy(&sample, bytes + i, sizeof(T));
        sample = static_cast<T>(scale<8 * sizeof(T)>(sample, gain));
        std::memcpy(bytes + i, &sample, sizeof(T));
    }
}

void scaleAll24(uint8_t* bytes, int64_t size, double gain) {
    for (int64_t i = 0; i + 3 <= size; i += 3) {
        const int32_t low = bytes[i] | bytes[i + 1] << 8;
        const int32_t sample = scale<24>(low | static_cast<int8_t>(bytes[i + 2]) * 65536, gain);
        bytes[i] = static_cast<uint8_t>(sample);
        bytes[i + 1] = static_cast<uint8_t>(sample >> 8);
        bytes[i + 2] = static_cast<uint8_t>(sample >> 16);
    }
}

template <class T> double readLevel(const uint8_t* bytes, double full) {
    T sample;
    std::memcpy(&sample, bytes, sizeof(T));
    // The lowest sample exceeds full level by one step.
    return std::min(1.0, std::abs(static_cast<double>(sample)) / full);
}

double readLevel(const uint8_t* bytes, int32_t bytesPerSample) {
    switch (bytesPerSample) {
    case 1:
        return readLevel<int8_t>(bytes, 127.0);
    case 2:
        return readLevel<int16_t>(bytes, 32767.0);
    case 4:
        return readLevel<int32_t>(bytes, 2147483647.0);
    default:
        return 0.0;
    }
}

} // namespace

void scaleSamples(void* samples, int64_t size, int32_t bytesPerSample, double gain) {
    auto* bytes = static_cast<uint8_t*>(samples);
    switch (bytesPerSample) {
    case 1:
        return scaleAll<int8_t>(bytes, size, gain);
    case 2:
        return scaleAll<int16_t>(bytes, size, gain);
    case 3:
        return scaleAll24(bytes, size, gain);
    default:
        return;
    }
}

void flipSigns(void* samples, int64_t size) {
    auto* bytes = static_cast<uint8_t*>(samples);
    for (int64_t i = 0; i < size; ++i) bytes[i] ^= 0x80;
}

std::optional<SLevels> readLevels(const void* frame, int32_t bytesPerSample, int32_t channelCount) {
    if (channelCount != 1 && channelCount != 2) return std::nullopt;
    const auto* bytes = static_cast<const uint8_t*>(frame);
    const double left = readLevel(bytes, bytesPerSample);
    return SLevels{left, channelCount == 1 ? left : readLevel(bytes + bytesPerSample, bytesPerSample)};
}

} // namespace peru::media
