// Writes WAV.
#pragma once

#include "support/Encoder.h"

namespace sonora2::plugins::wav {

// Writes the header itself: it keeps room for the 64-bit sizes of RF64 and uses it only when the file has
// really grown beyond 4 GiB, while a smaller file stays the plain WAV that every player knows.
class CWavEncoder : public IEncoder {
public:
    bool accepts(const SPcmFormat& format) const override;
    void open(COutputFile& file, const SEncoderSettings& settings) override;
    void write(const uint8_t* pcm, int frames) override;
    void update() override;
    void finish() override;
    int64_t estimateBytes(double seconds, const SEncoderSettings& settings) const override; // exact

private:
    void writeHeader();

    COutputFile* m_file = nullptr;
    SPcmFormat m_format;
    int64_t m_dataBytes = 0;
};

} // namespace sonora2::plugins::wav
