// Encodes MP3 with libmp3lame.
#pragma once

#include "support/Encoder.h"

#include <lame/lame.h>
#include <memory>
#include <vector>

namespace sonora2::plugins {

// A nominal bit rate alone selects a constant bit rate; with a minimum or maximum as well, an average bit
// rate within these limits. Otherwise the bit rate varies by quality: 1.0 is V0, 0.0 is V9.999, the default
// is V2.
class CMp3Encoder : public IEncoder {
public:
    bool accepts(const SPcmFormat& format) const override;
    uint32_t getUsedSettings() const override {
        return common::IFormatSettings::kQuality | common::IFormatSettings::kBitRate;
    }
    void open(COutputFile& file, const SEncoderSettings& settings) override;
    void write(const uint8_t* pcm, int frames) override;
    void finish() override;
    int64_t estimateBytes(double seconds, const SEncoderSettings& settings) const override;

private:
    struct SClose {
        void operator()(lame_t encoder) const { lame_close(encoder); }
    };

    void writeEncoded(int bytes);

    COutputFile* m_file = nullptr;
    SPcmFormat m_format;
    std::unique_ptr<lame_global_flags, SClose> m_encoder;
    std::vector<int32_t> m_samples;
    std::vector<unsigned char> m_encoded;
};

} // namespace sonora2::plugins
