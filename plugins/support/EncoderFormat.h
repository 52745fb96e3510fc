// An audio format that writes through an encoder.
#pragma once

#include "peru/threads/ThreadBudget.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/IAudioFormat.h"
#include "sonora2/media/IDiscardable.h"
#include "sonora2/media/IFloatSamples.h"
#include "support/Encoder.h"

#include <chrono>
#include <memory>

namespace sonora2::plugins {

// Opening creates the file; closing completes it, also in the middle of a job. A file that exists is replaced
// by close(), as a whole. A new one is complete on the disk twice a second while it grows, so that a
// recording whose process is killed can still be played. A failed write throws at once or at the latest from
// close(). Quality and bit rates can be set while closed. Each opening starts a new file.
class CEncoderFormat : public peru::CObject,
                       public common::IAudioFormat,
                       public common::IDiscardable,
                       public common::IFloatSamples,
                       public common::IFormatSettings {
public:
    // Created closed. `makeEncoder` returns a new encoder for each opening.
    using EncoderFactory = std::unique_ptr<IEncoder> (*)(const SMediaFile& file);
    CEncoderFormat(const P<peru::IString>& pluginName, const SMediaFile& file, EncoderFactory makeEncoder,
                   const SPcmFormat& format);
    ~CEncoderFormat() override; // closes; errors are ignored

    bool isOpened() override { return m_output != nullptr; }
    void open() override; // does nothing on an open format
    void close() override;
    void discard() noexcept override;
    P<peru::IURI> getURI() override { return m_file.uri; }
    P<peru::IString> getPluginName() override { return m_pluginName; }
    int64_t getEstimatedSizeBytes(double fDuration) override;

    uint32_t getUsedSettings() override { return m_estimator->getUsedSettings(); }
    int getSampleRate() override { return m_settings.format.rate; }
    int getChannelCount() override { return m_settings.format.channels; }
    int getBytesPerSample() override { return m_settings.format.bytesPerSample; }
    void setAudioQuality(double fQuality) override; // clamped to 0.0 to 1.0
    void setAudioBitRate(int nNominal, int nMin, int nMax) override;
    void writeAudioChunk(const P<audio::IAudioChunk>& pAudioChunk) override;

    bool canUseFloat(int bytesPerSample) override;
    void useFloat(int bytesPerSample) override;

private:
    void requireClosed(const peru::SLocalizedText& text) const;

    P<peru::IString> m_pluginName;
    SMediaFile m_file;
    EncoderFactory m_makeEncoder;
    std::unique_ptr<IEncoder> m_estimator; // used for estimates only, never opened
    const SPcmFormat m_integerFormat;      // unless floating point is used
    SEncoderSettings m_settings;
    std::unique_ptr<peru::CThreadShare> m_share;     // while open
    std::unique_ptr<COutputFile> m_output;           // while open
    std::unique_ptr<IEncoder> m_encoder;             // writes to the output
    std::chrono::steady_clock::time_point m_updated; // when the file was last complete on disk
    bool m_failed = false;                           // a write has thrown: the file cannot be completed
};

} // namespace sonora2::plugins
