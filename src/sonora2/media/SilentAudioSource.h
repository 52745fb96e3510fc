// Silence of a given length.
#pragma once

#include "peru/MemoryManager.h"
#include "peru/Object.h"
#include "sonora2/media/IAudioSource.h"

namespace sonora2 {

using peru::P;

// Always open. One thread at a time. All chunks share one block, which must not be modified.
class SONORA2_API CSilentAudioSource : public peru::CObject, public common::IAudioSource {
public:
    static constexpr int kFramesPerChunk = 500;

    CSilentAudioSource(const P<peru::IMemoryManager>& memoryManager, double duration, int sampleRate,
                       int channelCount, int bytesPerSample);
    ~CSilentAudioSource() override;

    bool isOpened() override { return true; }
    void open() override { m_position = 0; }
    void close() override {}
    void skipToTime(double fTimestamp) override;
    double getDuration() override { return m_duration; }
    int getBufferStatus() override { return 100; }
    bool isEOF() override;
    void setStartTime(double fStartTime) override {}
    double getStartTime() override { return 0.0; }
    P<peru::IURI> getURI() override; // an empty URI
    P<peru::IString> getPluginName() override;
    P<audio::IAudioStreamInfos> getAudioStreamInfos() override; // one stream
    void setAudioStream(int nAudioIndex) override {}
    P<audio::IAudioChunk> getNextAudioChunk() override;
    int getSampleRate() override { return m_sampleRate; }
    int getChannelCount() override { return m_channelCount; }
    int getBytesPerSample() override { return m_bytesPerSample; }

private:
    double m_duration; // seconds
    int m_sampleRate;
    int m_channelCount;
    int m_bytesPerSample;
    int64_t m_position = 0; // frames
    P<peru::IMemoryBlock> m_block;
};

} // namespace sonora2
