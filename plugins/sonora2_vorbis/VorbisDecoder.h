// Decodes Ogg Vorbis with libvorbisfile.
#pragma once

#include "support/Decoder.h"

#include <vector>
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
    int decode(uint8_t* pcm, int frames);      // 0 also when there is silence or a rest to deliver
    int decodeBlock(uint8_t* pcm, int frames); // OV_HOLE where data was lost
    void skipGap(int64_t frames);              // throws unless it may be filled with silence
    void forget(int64_t position);

    SMediaFile m_file;
    SDecoderOptions m_options;
    SPcmFormat m_format;
    bool m_opened = false;
    OggVorbis_File m_stream = {};
    int64_t m_position = 0; // next frame to deliver
    int64_t m_silence = 0;  // frames to deliver before the rest, for sound that is missing
    std::vector<uint8_t> m_rest;
    size_t m_restStart = 0;
};

} // namespace sonora2::plugins
