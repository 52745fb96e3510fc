#include "host_support/GainSource.h"

#include "peru/IInterfaceQuery.h"
#include "peru/strings/IStringLocalizer.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/AudioChunk.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>

namespace tonewright::host_support {

using sonora2::common::IFloatSamples;

namespace {

constexpr int kFloat = 8; // added to the width

// `Format` is a width, plus kFloat for floating-point samples. Integers have the range -1.0 to 1.0.
template <int Format> double load(const uint8_t* bytes) {
    if constexpr (Format == kFloat + 4 || Format == kFloat + 8) {
        std::conditional_t<Format == kFloat + 4, float, double> sample;
        std::memcpy(&sample, bytes, sizeof sample);
        return sample;
    } else {
        uint32_t value = 0;
        std::memcpy(reinterpret_cast<uint8_t*>(&value) + 4 - Format, bytes, Format);
        if constexpr (Format == 1) value ^= 0x80000000;
        return static_cast<double>(static_cast<int32_t>(value)) / 2147483648.0;
    }
}

template <int Format> void store(double sample, uint8_t* bytes) {
    if constexpr (Format == kFloat + 4 || Format == kFloat + 8) {
        using Sample = std::conditional_t<Format == kFloat + 4, float, double>;
        constexpr double kGreatest = std::numeric_limits<Sample>::max();
        // A conversion of a greater number is undefined.
        const auto value =
            static_cast<Sample>(std::isfinite(sample) ? std::clamp(sample, -kGreatest, kGreatest) : sample);
        std::memcpy(bytes, &value, sizeof value);
    } else {
        constexpr double kScale = static_cast<double>(int64_t{1} << (8 * Format - 1));
        const double scaled = std::isnan(sample) ? 0.0 : sample * kScale;
        auto value = static_cast<uint32_t>(std::llrint(std::clamp(scaled, -kScale, kScale - 1)));
        if constexpr (Format == 1) value ^= 0x80;
        std::memcpy(bytes, &value, Format);
    }
}

template <int From, int To> void multiply(const uint8_t* from, uint8_t* to, size_t count, double gain) {
    constexpr size_t kFromBytes = From % kFloat == 0 ? 8 : From % kFloat;
    constexpr size_t kToBytes = To % kFloat == 0 ? 8 : To % kFloat;
    for (size_t i = 0; i < count; ++i) store<To>(load<From>(from + i * kFromBytes) * gain, to + i * kToBytes);
}

using Multiply = void (*)(const uint8_t*, uint8_t*, size_t, double);

template <int From> Multiply findMultiply(int to) {
    constexpr Multiply kToIntegers[] = {multiply<From, 1>, multiply<From, 2>, multiply<From, 3>,
                                        multiply<From, 4>};
    return kToIntegers[to - 1];
}

Multiply findMultiply(int from, int floatBytes, int to, bool passesFloat) {
    if (passesFloat)
        return floatBytes == 4 ? multiply<kFloat + 4, kFloat + 4> : multiply<kFloat + 8, kFloat + 8>;
    if (floatBytes > 0) return floatBytes == 4 ? findMultiply<kFloat + 4>(to) : findMultiply<kFloat + 8>(to);
    constexpr Multiply (*kFind[])(int) = {findMultiply<1>, findMultiply<2>, findMultiply<3>, findMultiply<4>};
    return kFind[from - 1](to);
}

} // namespace

CGainSource::CGainSource(const P<sonora2::common::IAudioSource>& source, double gain, int bytesPerSample)
    : m_source(source), m_gain(gain), m_width(bytesPerSample), m_memory(peru::make<peru::CMemoryManager>()) {
    if (m_source->isOpened()) prepare();
}

CGainSource::~CGainSource() = default;

void CGainSource::open() {
    if (isOpened()) return;
    m_source->open();
    prepare();
}

void CGainSource::prepare() {
    m_ownWidth = m_source->getBytesPerSample();
    m_floatBytes = 0;
    const auto samples = peru::interfaceCast<IFloatSamples>(m_source);
    for (const int bytes : {4, 8})
        if (m_floatBytes == 0 && samples && samples->canUseFloat(bytes)) {
            samples->useFloat(bytes);
            m_floatBytes = bytes;
        }
    if (m_floatBytes == 0 && (m_ownWidth < 1 || m_ownWidth > 4))
        throw sonora2::common::CSonoraError(peru::localize(
            "tonewright.Loudness.unknownWidth", "The source has no gain: its width of samples is unknown"));
}

void CGainSource::close() {
    m_passesFloat = false;
    m_floatBytes = 0;
    m_source->close();
}

int CGainSource::getBytesPerSample() {
    if (m_passesFloat) return m_floatBytes;
    if (m_width > 0) return m_width;
    return m_floatBytes > 0 ? m_ownWidth : m_source->getBytesPerSample();
}

bool CGainSource::canUseFloat(int bytesPerSample) {
    return isOpened() && m_width == 0 && bytesPerSample > 0 && bytesPerSample == m_floatBytes;
}

void CGainSource::useFloat(int bytesPerSample) {
    if (!canUseFloat(bytesPerSample))
        throw sonora2::common::CSonoraError(peru::localize(
            "tonewright.Loudness.noFloat", "The source has no floating-point samples of that width"));
    m_passesFloat = true;
}

P<sonora2::audio::IAudioChunk> CGainSource::getNextAudioChunk() {
    const P<sonora2::audio::IAudioChunk> chunk = m_source->getNextAudioChunk();
    const int to = getBytesPerSample();
    if (!chunk || (m_gain == 1.0 && m_floatBytes == 0 && to == m_ownWidth)) return chunk;
    const int from = m_floatBytes > 0 ? m_floatBytes : m_ownWidth;
    const size_t count = chunk->getSize() / static_cast<uint32_t>(from);
    P<peru::IMemoryBlock> block = m_memory->getBlock(static_cast<int64_t>(count) * to);
    findMultiply(from, m_floatBytes, to, m_passesFloat)(chunk->getData(), block->getData(), count, m_gain);
    return peru::make<sonora2::audio::CAudioChunk>(chunk->getTimestamp(), std::move(block));
}

} // namespace tonewright::host_support
