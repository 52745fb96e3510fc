// Decodes Ogg Vorbis with libvorbisfile.
#pragma once

#include "support/Decoder.h"

#include <vorbis/vorbisfile.h>

namespace sonora2::plugins {

// Delivers 16 bits; the codec has no native width.
class CVorbisDecoder : public IDecoder {
public:
    explicit CVorbisDecoder(const SMediaFile& file) : m_file(file) {}
    ~CVorbisDecoder() override { close(); }

    SDecodedMedia open(const SDecoderOptions& options) override;
    void close() override;
    int read(uint8_t* pcm, int frames) override;
    void seek(int64_t frame) override;

private:
    SMediaFile m_file;
    SPcmFormat m_format;
    bool m_opened = false;
    OggVorbis_File m_stream = {};
};

} // namespace sonora2::plugins
