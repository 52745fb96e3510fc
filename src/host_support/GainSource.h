// A source with its samples multiplied.
#pragma once

#include "peru/MemoryManager.h"
#include "sonora2/media/IAudioSource.h"
#include "sonora2/media/IFloatSamples.h"

namespace tonewright::host_support {

using peru::P;

// Everything but the samples is that of the other source. Floating-point samples are read from it wherever it
// can deliver them, so that rounding and clipping happen once, after the multiplication.
class CGainSource : public peru::CObject,
                    public sonora2::common::IAudioSource,
                    public sonora2::common::IFloatSamples {
public:
    // `bytesPerSample`: 0 selects the other source's width.
    CGainSource(const P<sonora2::common::IAudioSource>& source, double gain, int bytesPerSample);
    ~CGainSource() override;

    bool isOpened() override { return m_source->isOpened(); }
    void open() override;
    void close() override;
    void skipToTime(double fTimestamp) override { m_source->skipToTime(fTimestamp); }
    double getDuration() override { return m_source->getDuration(); }
    int getBufferStatus() override { return m_source->getBufferStatus(); }
    bool isEOF() override { return m_source->isEOF(); }
    void setStartTime(double fStartTime) override { m_source->setStartTime(fStartTime); }
    double getStartTime() override { return m_source->getStartTime(); }
    P<peru::IURI> getURI() override { return m_source->getURI(); }
    P<peru::IString> getPluginName() override { return m_source->getPluginName(); }

    P<sonora2::audio::IAudioStreamInfos> getAudioStreamInfos() override {
        return m_source->getAudioStreamInfos();
    }
    void setAudioStream(int nAudioIndex) override { m_source->setAudioStream(nAudioIndex); }
    P<sonora2::audio::IAudioChunk> getNextAudioChunk() override;
    int getSampleRate() override { return m_source->getSampleRate(); }
    int getChannelCount() override { return m_source->getChannelCount(); }
    int getBytesPerSample() override;

    bool canUseFloat(int bytesPerSample) override;
    void useFloat(int bytesPerSample) override;

private:
    void prepare();

    const P<sonora2::common::IAudioSource> m_source;
    const double m_gain;
    const int m_width; // 0: that of the source
    P<peru::IMemoryManager> m_memory;
    int m_ownWidth = 0;         // of the source's integers; known once open
    int m_floatBytes = 0;       // of the samples that the source delivers; 0 for integers
    bool m_passesFloat = false; // on to the reader
};

} // namespace tonewright::host_support
