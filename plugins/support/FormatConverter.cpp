#include "support/FormatConverter.h"

#include "support/Pcm.h"

#include <algorithm>
#include <cstring>
#include <limits>

namespace sonora2::plugins {

namespace {

constexpr int kMixedChannels = 3; // the most for which the matrix of equal layouts keeps every channel

bool isSeparate(int fromChannels, int toChannels) {
    return fromChannels == toChannels && fromChannels > kMixedChannels;
}

// Moves samples between places that are `fromStep` and `toStep` bytes apart.
template <size_t Bytes>
void moveSamples(const uint8_t* from, size_t fromStep, uint8_t* to, size_t toStep, size_t count) {
    for (size_t i = 0; i < count; ++i) std::memcpy(to + i * toStep, from + i * fromStep, Bytes);
}

void moveSamples(const uint8_t* from, int fromStep, uint8_t* to, int toStep, int bytes, int64_t count) {
    using Move = void (*)(const uint8_t*, size_t, uint8_t*, size_t, size_t);
    constexpr Move kMoves[] = {moveSamples<1>, moveSamples<2>, moveSamples<3>, moveSamples<4>};
    kMoves[bytes - 1](from, static_cast<size_t>(fromStep), to, static_cast<size_t>(toStep),
                      static_cast<size_t>(count));
}

} // namespace

CFormatConverter::CFormatConverter(const SPcmFormat& from, const SPcmFormat& to,
                                   const P<peru::IMemoryManager>& memory)
    : m_from(from), m_to(to), m_memory(memory) {
    if (from.rate == to.rate && from.channels == to.channels) return;
    const bool separate = isSeparate(from.channels, to.channels);
    const int fromChannels = separate ? 1 : from.channels;
    const int toChannels = separate ? 1 : to.channels;
    for (int i = 0; i < (separate ? from.channels : 1); ++i)
        m_converters.push_back(peru::make<CConverter>(from.rate, fromChannels, from.bytesPerSample, to.rate,
                                                      toChannels, to.bytesPerSample, memory));
}

CFormatConverter::~CFormatConverter() = default;

bool CFormatConverter::canConvert(int fromChannels, int toChannels) {
    return fromChannels == toChannels || CConverter::canConvert(fromChannels, toChannels);
}

P<peru::IMemoryBlock> CFormatConverter::convert(const uint8_t* pcm, int frames) {
    if (m_converters.empty()) return changeWidth(pcm, frames);
    if (m_converters.size() > 1) return convertSeparately(pcm, frames);
    return m_converters.front()->convert(pcm, frames * m_from.frameBytes())->getMemoryBlock();
}

P<peru::IMemoryBlock> CFormatConverter::changeWidth(const uint8_t* pcm, int frames) {
    m_samples.resize(static_cast<size_t>(frames) * static_cast<size_t>(m_from.channels));
    pcm::unpack(pcm, m_from.bytesPerSample, m_samples.data(), m_samples.size());
    const int dropped = 8 * (m_from.bytesPerSample - m_to.bytesPerSample); // bits
    if (dropped > 0) {
        const int32_t half = 1 << (dropped - 1);
        const int32_t highest = std::numeric_limits<int32_t>::max() >> (32 - 8 * m_from.bytesPerSample);
        for (int32_t& sample : m_samples) sample = (std::min(sample, highest - half) + half) >> dropped;
    } else {
        for (int32_t& sample : m_samples) sample <<= -dropped;
    }
    P<peru::IMemoryBlock> block = m_memory->getBlock(int64_t{frames} * m_to.frameBytes());
    pcm::pack(m_samples.data(), block->getData(), m_to.bytesPerSample, m_samples.size());
    return block;
}

P<peru::IMemoryBlock> CFormatConverter::convertSeparately(const uint8_t* pcm, int frames) {
    P<peru::IMemoryBlock> result;
    const int bytes = m_from.bytesPerSample;
    m_channel.resize(static_cast<size_t>(frames) * static_cast<size_t>(bytes));
    for (int channel = 0; channel < m_from.channels; ++channel) {
        if (frames > 0)
            moveSamples(pcm + channel * bytes, m_from.frameBytes(), m_channel.data(), bytes, bytes, frames);
        const P<peru::IMemoryBlock> converted =
            m_converters[static_cast<size_t>(channel)]
                ->convert(m_channel.data(), static_cast<int>(m_channel.size()))
                ->getMemoryBlock();
        const int64_t count = converted->getSize() / m_to.bytesPerSample; // the same for all channels
        if (!result) result = m_memory->getBlock(count * m_to.frameBytes());
        moveSamples(converted->getData(), m_to.bytesPerSample,
                    result->getData() + channel * m_to.bytesPerSample, m_to.frameBytes(), m_to.bytesPerSample,
                    count);
    }
    return result;
}

} // namespace sonora2::plugins
