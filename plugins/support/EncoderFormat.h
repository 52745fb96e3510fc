// The audio format over an encoder.
#pragma once

#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/IAudioFormat.h"
#include "support/Encoder.h"

#include <chrono>
#include <memory>

namespace sonora2::plugins {

// Opening makes or replaces the file once the encoder has accepted its settings; closing completes it, also
// in the middle of a job. What is slowly written, as a recording is, lies complete on the disk twice a
// second: a process that is killed leaves a file that plays. A failure to write is thrown by the write that
// meets it or at last by close(). Quality and bit rates are taken while closed. Each opening starts the file
// anew.
class CEncoderFormat : public peru::CObject, public common::IAudioFormat {
public:
    // Closed. `makeEncoder` gives a fresh encoder for each opening.
    using EncoderFactory = std::unique_ptr<IEncoder> (*)(const SMediaFile& file);
    CEncoderFormat(const P<peru::IString>& pluginName, const SMediaFile& file, EncoderFactory makeEncoder,
                   const SPcmFormat& format);
    ~CEncoderFormat() override; // closes without a word

    bool isOpened() override { return m_output != nullptr; }
    void open() override; // does nothing on an open format
    void close() override;
    P<peru::IURI> getURI() override { return m_file.uri; }
    P<peru::IString> getPluginName() override { return m_pluginName; }
    int64_t getEstimatedSizeBytes(double fDuration) override;

    int getSampleRate() override { return m_settings.format.rate; }
    int getChannelCount() override { return m_settings.format.channels; }
    int getBytesPerSample() override { return m_settings.format.bytesPerSample; }
    void setAudioQuality(double fQuality) override; // clamped to 0.0 to 1.0
    void setAudioBitRate(int nNominal, int nMin, int nMax) override;
    void writeAudioChunk(const P<audio::IAudioChunk>& pAudioChunk) override;

private:
    void requireClosed(const char* what) const;

    P<peru::IString> m_pluginName;
    SMediaFile m_file;
    EncoderFactory m_makeEncoder;
    std::unique_ptr<IEncoder> m_estimator; // used for estimates only, never opened
    SEncoderSettings m_settings;
    std::unique_ptr<COutputFile> m_output;           // while open
    std::unique_ptr<IEncoder> m_encoder;             // writes to the output
    std::chrono::steady_clock::time_point m_updated; // when the file was last complete on the disk
    bool m_failed = false;                           // a write has thrown: nothing is to be finished
};

} // namespace sonora2::plugins
