// Encodes Ogg Vorbis with libvorbisenc.
#pragma once

#include "support/Encoder.h"

#include <vorbis/codec.h>

namespace sonora2::plugins {

// Quality 0.0 to 1.0 is the codec's own scale, by default 0.3. A nominal bit rate selects an average bit
// rate, limits select a managed one.
class CVorbisEncoder : public IEncoder {
public:
    CVorbisEncoder();
    ~CVorbisEncoder() override;

    bool accepts(const SPcmFormat& format) const override;
    uint32_t getUsedSettings() const override {
        return common::IFormatSettings::kQuality | common::IFormatSettings::kBitRate;
    }
    void open(COutputFile& file, const SEncoderSettings& settings) override;
    void write(const uint8_t* pcm, int frames) override;
    void finish() override;
    int64_t estimateBytes(double seconds, const SEncoderSettings& settings) const override;

private:
    void writeHeaders();
    void encodeBlocks();
    void writePage(const ogg_page& page);

    COutputFile* m_file = nullptr;
    SPcmFormat m_format;
    vorbis_info m_info;
    vorbis_comment m_comment;
    vorbis_dsp_state m_state = {};
    vorbis_block m_block = {};
    ogg_stream_state m_stream = {};
};

} // namespace sonora2::plugins
