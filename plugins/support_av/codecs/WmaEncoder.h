// Writes Windows Media Audio in ASF files.
#pragma once

#include "codecs/AvHandles.h"
#include "support/Encoder.h"

#include <vector>

namespace sonora2::plugins::av {

// At a constant bit rate: the nominal one, or 64 to 320 kbit/s by quality; 160 kbit/s by default.
class CWmaEncoder : public IEncoder {
public:
    ~CWmaEncoder() override;

    bool accepts(const SPcmFormat& format) const override;
    uint32_t getUsedSettings() const override {
        return common::IFormatSettings::kQuality | common::IFormatSettings::kBitRate;
    }
    void open(COutputFile& file, const SEncoderSettings& settings) override;
    void write(const uint8_t* pcm, int frames) override;
    void update() override; // what is in the file can be read, without a length
    void finish() override;
    int64_t estimateBytes(double seconds, const SEncoderSettings& settings) const override;

private:
    void check(int result) const;
    void encode(AVFrame* frame); // null at the end
    void sendBlock();
    static int writeBytes(void* self, uint8_t* bytes, int size);
    static int64_t seekBytes(void* self, int64_t offset, int whence);

    COutputFile* m_file = nullptr;
    SPcmFormat m_format;
    IoContext m_io;
    AVFormatContext* m_container = nullptr;
    Codec m_codec;
    Frame m_frame;
    Packet m_packet;
    int m_filled = 0; // frames in the block
    int64_t m_written = 0;
};

} // namespace sonora2::plugins::av
