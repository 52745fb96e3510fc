#include "support/Pcm.h"

#include <bit>
#include <cstring>

namespace sonora2::plugins::pcm {

static_assert(std::endian::native == std::endian::little, "samples are moved as they lie in memory");

namespace {

// Single samples of each width. 24-bit samples are read as three bytes here; the dense loops below read four.
template <int Bytes> inline int32_t load(const uint8_t* at) {
    if constexpr (Bytes == 1) {
        return static_cast<int32_t>(*at) - 128;
    } else if constexpr (Bytes == 2) {
        int16_t value;
        std::memcpy(&value, at, 2);
        return value;
    } else if constexpr (Bytes == 3) {
        const uint32_t bits = static_cast<uint32_t>(at[0]) << 8 | static_cast<uint32_t>(at[1]) << 16 |
                              static_cast<uint32_t>(at[2]) << 24;
        return static_cast<int32_t>(bits) >> 8;
    } else {
        int32_t value;
        std::memcpy(&value, at, 4);
        return value;
    }
}

template <int Bytes> inline void store(int32_t value, uint8_t* at) {
    if constexpr (Bytes == 1) {
        *at = static_cast<uint8_t>(value + 128);
    } else if constexpr (Bytes == 2) {
        const int16_t narrow = static_cast<int16_t>(value);
        std::memcpy(at, &narrow, 2);
    } else if constexpr (Bytes == 3) {
        at[0] = static_cast<uint8_t>(value);
        at[1] = static_cast<uint8_t>(value >> 8);
        at[2] = static_cast<uint8_t>(value >> 16);
    } else {
        std::memcpy(at, &value, 4);
    }
}

// Calls the function with the width as a compile-time constant.
template <class Function> void withWidth(int bytesPerSample, const Function& function) {
    switch (bytesPerSample) {
    case 1:
        return function.template operator()<1>();
    case 2:
        return function.template operator()<2>();
    case 3:
        return function.template operator()<3>();
    default:
        return function.template operator()<4>();
    }
}

template <int Bytes> constexpr float kFullScale = static_cast<float>(int64_t{1} << (8 * Bytes - 1));
// The largest value below full scale that a float can hold; at 32 bits this is less than INT32_MAX.
template <int Bytes> constexpr float kHighest = Bytes == 4
                                                    ? 2147483520.0f
                                                    : static_cast<float>((int64_t{1} << (8 * Bytes - 1)) - 1);

template <int Bytes> inline int32_t quantise(float sample) {
    float value = sample * kFullScale<Bytes>;
    value = value == value ? value : 0.0f;
    value = value < -kFullScale<Bytes> ? -kFullScale<Bytes> : value;
    value = value > kHighest<Bytes> ? kHighest<Bytes> : value;
    // Adding one half and truncating rounds to nearest and, unlike lrint, vectorises everywhere. At 24 bits
    // and above a float has no significant fraction left.
    if constexpr (Bytes >= 3) return static_cast<int32_t>(value);
    return static_cast<int32_t>(value + (value < 0.0f ? -0.5f : 0.5f));
}

} // namespace

void unpack(const uint8_t* pcm, int bytesPerSample, int32_t* samples, size_t count) {
    withWidth(bytesPerSample, [&]<int Bytes>() {
        size_t i = 0;
        if constexpr (Bytes == 3) {
            for (; i + 1 < count; ++i) {
                uint32_t bits;
                std::memcpy(&bits, pcm + i * 3, 4);
                samples[i] = static_cast<int32_t>(bits << 8) >> 8;
            }
        }
        for (; i < count; ++i) samples[i] = load<Bytes>(pcm + i * Bytes);
    });
}

void pack(const int32_t* samples, uint8_t* pcm, int bytesPerSample, size_t count) {
    withWidth(bytesPerSample, [&]<int Bytes>() {
        for (size_t i = 0; i < count; ++i) store<Bytes>(samples[i], pcm + i * Bytes);
    });
}

void unpackChannel(const uint8_t* pcm, int bytesPerSample, int stride, int32_t* samples, size_t frames) {
    withWidth(bytesPerSample, [&]<int Bytes>() {
        if (stride == 2) {
            for (size_t i = 0; i < frames; ++i) samples[i] = load<Bytes>(pcm + i * (2 * Bytes));
        } else {
            const size_t step = static_cast<size_t>(stride) * Bytes;
            for (size_t i = 0; i < frames; ++i) samples[i] = load<Bytes>(pcm + i * step);
        }
    });
}

void packPlanes(const int32_t* const planes[], int channels, uint8_t* pcm, int bytesPerSample, size_t frames,
                int shift) {
    withWidth(bytesPerSample, [&]<int Bytes>() {
        if (channels == 2) {
            const int32_t* left = planes[0];
            const int32_t* right = planes[1];
            for (size_t i = 0; i < frames; ++i) {
                store<Bytes>(left[i] << shift, pcm + i * (2 * Bytes));
                store<Bytes>(right[i] << shift, pcm + i * (2 * Bytes) + Bytes);
            }
            return;
        }
        const size_t step = static_cast<size_t>(channels) * Bytes;
        for (int channel = 0; channel < channels; ++channel) {
            const int32_t* plane = planes[channel];
            uint8_t* at = pcm + channel * Bytes;
            for (size_t i = 0; i < frames; ++i) store<Bytes>(plane[i] << shift, at + i * step);
        }
    });
}

void packFloat(const float* samples, uint8_t* pcm, int bytesPerSample, size_t count) {
    withWidth(bytesPerSample, [&]<int Bytes>() {
        for (size_t i = 0; i < count; ++i) store<Bytes>(quantise<Bytes>(samples[i]), pcm + i * Bytes);
    });
}

void packPlanesFloat(const float* const planes[], int channels, uint8_t* pcm, int bytesPerSample,
                     size_t frames) {
    withWidth(bytesPerSample, [&]<int Bytes>() {
        if (channels == 2) {
            const float* left = planes[0];
            const float* right = planes[1];
            for (size_t i = 0; i < frames; ++i) {
                store<Bytes>(quantise<Bytes>(left[i]), pcm + i * (2 * Bytes));
                store<Bytes>(quantise<Bytes>(right[i]), pcm + i * (2 * Bytes) + Bytes);
            }
            return;
        }
        const size_t step = static_cast<size_t>(channels) * Bytes;
        for (int channel = 0; channel < channels; ++channel) {
            const float* plane = planes[channel];
            uint8_t* at = pcm + channel * Bytes;
            for (size_t i = 0; i < frames; ++i) store<Bytes>(quantise<Bytes>(plane[i]), at + i * step);
        }
    });
}

void unpackChannelFloat(const uint8_t* pcm, int bytesPerSample, int stride, float* samples, size_t frames) {
    withWidth(bytesPerSample, [&]<int Bytes>() {
        constexpr float kScale = 1.0f / kFullScale<Bytes>;
        const size_t step = static_cast<size_t>(stride) * Bytes;
        for (size_t i = 0; i < frames; ++i)
            samples[i] = static_cast<float>(load<Bytes>(pcm + i * step)) * kScale;
    });
}

void flipSign8(uint8_t* pcm, size_t count) {
    for (size_t i = 0; i < count; ++i) pcm[i] ^= 0x80;
}

} // namespace sonora2::plugins::pcm
