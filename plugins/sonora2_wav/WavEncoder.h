// Encodes WAV, also with floating-point samples.
#pragma once

#include "support/Encoder.h"

namespace sonora2::plugins::wav {

// The header reserves space for the 64-bit sizes of RF64. They are only used when the file has grown beyond
// 4 GiB; smaller files remain plain WAV, which every player can read.
class CWavEncoder : public IEncoder {
public:
    bool accepts(const SPcmFormat& format) const override;
    uint32_t getUsedSettings() const override { return common::IFormatSettings::kSampleWidth; }
    void open(COutputFile& file, const SEncoderSettings& settings) override;
    void write(const uint8_t* pcm, int frames) override;
    void update() override;
    void finish() override;
    int64_t estimateBytes(double seconds, const SEncoderSettings& settings) const override; // exact
    bool holdsFloat(const SPcmFormat& format) const override;

private:
    void writeHeader();

    COutputFile* m_file = nullptr;
    SPcmFormat m_format;
    int64_t m_dataBytes = 0;
};

} // namespace sonora2::plugins::wav
