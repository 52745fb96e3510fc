// Reads MPEG audio, layers I to III, with libmpg123.
#pragma once

#include "support/Decoder.h"

#include <memory>
#include <mpg123.h>

namespace sonora2::plugins {

// Delivers 16 bit. What an encoder put before and behind the sound is cut off where the file tells how much.
class CMpegDecoder : public IDecoder {
public:
    explicit CMpegDecoder(const SMediaFile& file) : m_file(file) {}

    SDecodedMedia open() override;
    void close() override { m_handle.reset(); }
    int read(uint8_t* pcm, int frames) override;
    void seek(int64_t frame) override;

private:
    struct SDelete {
        void operator()(mpg123_handle* handle) const { mpg123_delete(handle); } // closes the file as well
    };

    [[noreturn]] void failWith(const char* doing);

    SMediaFile m_file;
    SPcmFormat m_format;
    std::unique_ptr<mpg123_handle, SDelete> m_handle;
};

} // namespace sonora2::plugins
