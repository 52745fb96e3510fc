#include "sonora2/samplerateconverter/SampleWidths.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <limits>

namespace sonora2::samplerateconverter {

static_assert(std::endian::native == std::endian::little, "samples are taken from memory as they stand");

namespace {

template <int CHANNELS, class Sample>
void interleavePlanes(const std::array<const Sample*, 6>& planes, int frames, Sample* __restrict out) {
    std::array<const Sample*, CHANNELS> in;
    for (int c = 0; c < CHANNELS; ++c) in[c] = planes[c];
    for (int i = 0; i < frames; ++i)
        for (int c = 0; c < CHANNELS; ++c) out[i * CHANNELS + c] = in[c][i];
}

template <class Sample>
void interleaveAny(const std::array<const Sample*, 6>& planes, int channels, int frames, Sample* out) {
    switch (channels) {
    case 1:
        std::memcpy(out, planes[0], static_cast<size_t>(frames) * sizeof(Sample));
        break;
    case 2:
        interleavePlanes<2>(planes, frames, out);
        break;
    case 3:
        interleavePlanes<3>(planes, frames, out);
        break;
    case 6:
        interleavePlanes<6>(planes, frames, out);
        break;
    }
}

} // namespace

void widenToShort(const uint8_t* __restrict bytes, int bytesPerSample, int64_t samples,
                  int16_t* __restrict out) {
    switch (bytesPerSample) {
    case 1:
        for (int64_t i = 0; i < samples; ++i) out[i] = static_cast<int16_t>((bytes[i] - 128) * 256);
        break;
    case 2:
        std::memcpy(out, bytes, static_cast<size_t>(samples) * sizeof(int16_t));
        break;
    case 3:
        for (int64_t i = 0; i < samples; ++i)
            out[i] = static_cast<int16_t>(bytes[3 * i + 1] | bytes[3 * i + 2] << 8);
        break;
    case 4:
        for (int64_t i = 0; i < samples; ++i) {
            uint32_t sample;
            std::memcpy(&sample, bytes + 4 * i, sizeof(sample));
            out[i] = static_cast<int16_t>(sample >> 16);
        }
        break;
    }
}

void interleave(const std::array<const int16_t*, 6>& planes, int channels, int frames, int16_t* out) {
    interleaveAny(planes, channels, frames, out);
}

void interleave(const std::array<const int32_t*, 6>& planes, int channels, int frames, int32_t* out) {
    interleaveAny(planes, channels, frames, out);
}

void widenToInt(const uint8_t* __restrict bytes, int bytesPerSample, int64_t samples,
                int32_t* __restrict out) {
    const uint32_t sign = bytesPerSample == 1 ? 0x80000000u : 0u;
    for (int64_t i = 0; i < samples; ++i) {
        uint32_t sample = 0;
        for (int b = 0; b < bytesPerSample; ++b)
            sample |= uint32_t{bytes[i * bytesPerSample + b]} << (8 * (4 - bytesPerSample + b));
        out[i] = static_cast<int32_t>(sample ^ sign);
    }
}

void narrowTo24(const int32_t* __restrict samples, int64_t count, uint8_t* __restrict out) {
    constexpr int32_t kHalf = 0x80;
    for (int64_t i = 0; i < count; ++i) {
        const int32_t sample = std::min(samples[i], std::numeric_limits<int32_t>::max() - kHalf) + kHalf;
        for (int b = 0; b < 3; ++b) out[3 * i + b] = static_cast<uint8_t>(sample >> (8 * (b + 1)));
    }
}

void narrowToByte(const int16_t* __restrict samples, int64_t count, uint8_t* __restrict out) {
    for (int64_t i = 0; i < count; ++i)
        out[i] = static_cast<uint8_t>(static_cast<int>((samples[i] / 65535.0 + 0.5) * 255.0));
}

} // namespace sonora2::samplerateconverter
