// The sample format of a sound device.
#pragma once

#include "peru/Object.h"
#include "peru/media/Api.h"

#include <cstdint>

namespace peru::media {

// Interleaved linear PCM, little-endian; 8-bit samples are unsigned, wider ones signed. Immutable.
class PERU_MEDIA_API CAudioFormat : public CObject {
public:
    CAudioFormat(int32_t sampleRate, int32_t channelCount, int32_t bitsPerSample)
        : m_sampleRate(sampleRate), m_channelCount(channelCount), m_bitsPerSample(bitsPerSample) {}
    ~CAudioFormat() override;

    int32_t getSampleRate() const { return m_sampleRate; } // hertz
    int32_t getChannelCount() const { return m_channelCount; }
    int32_t getBitsPerSample() const { return m_bitsPerSample; }
    int32_t getBytesPerSample() const { return m_bitsPerSample / 8; }
    int32_t getBytesPerFrame() const { return m_channelCount * getBytesPerSample(); }
    // "Sample Rate: 44100 Channel: 2 Bits: 16"
    P<IString> getDescription() const;

private:
    const int32_t m_sampleRate;
    const int32_t m_channelCount;
    const int32_t m_bitsPerSample;
};

} // namespace peru::media
