#include "sonora2/media/SilentAudioSource.h"

#include "peru/uri/URI.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/media/AudioStreamInfos.h"

#include <algorithm>
#include <cstring>

namespace sonora2 {

namespace {

constexpr double kLastPosition = 1e15;

} // namespace

CSilentAudioSource::CSilentAudioSource(const P<peru::IMemoryManager>& memoryManager, double duration,
                                       int sampleRate, int channelCount, int bytesPerSample)
    : m_duration(duration), m_sampleRate(sampleRate), m_channelCount(channelCount),
      m_bytesPerSample(bytesPerSample),
      m_block(memoryManager->getBlock(int64_t{channelCount} * bytesPerSample * kFramesPerChunk)) {
    std::memset(m_block->getData(), 0, static_cast<size_t>(m_block->getSize()));
}

CSilentAudioSource::~CSilentAudioSource() = default;

void CSilentAudioSource::skipToTime(double fTimestamp) {
    m_position = static_cast<int64_t>(std::min(std::max(0.0, m_sampleRate * fTimestamp), kLastPosition));
}

bool CSilentAudioSource::isEOF() {
    return static_cast<double>(m_position) / m_sampleRate >= m_duration;
}

P<peru::IURI> CSilentAudioSource::getURI() {
    return peru::make<peru::CURI>("");
}

P<peru::IString> CSilentAudioSource::getPluginName() {
    return peru::CString::fromUTF8("CSilentAudioSource");
}

P<audio::IAudioStreamInfos> CSilentAudioSource::getAudioStreamInfos() {
    auto infos = peru::make<audio::CAudioStreamInfos>();
    infos->add(peru::make<audio::CAudioInfo>(0));
    return infos;
}

P<audio::IAudioChunk> CSilentAudioSource::getNextAudioChunk() {
    if (isEOF()) return nullptr;
    const double timestamp = static_cast<double>(m_position) / m_sampleRate;
    m_position += kFramesPerChunk;
    return peru::make<audio::CAudioChunk>(timestamp, m_block);
}

} // namespace sonora2
