// Decodes WAV and similar containers with libsndfile.
#pragma once

#include "support/Decoder.h"

#include <sndfile.h>

#include <vector>

namespace sonora2::plugins::wav {

struct SSndfileCloser {
    void operator()(SNDFILE* file) const { sf_close(file); }
};
using SndfileHandle = std::unique_ptr<SNDFILE, SSndfileCloser>;

// Linear PCM is delivered bit for bit, floating point as 32 bits, compressed samples as the 16 bits that they
// were made from. A stated length that the file cannot hold is reduced to what is there.
class CSndfileDecoder : public IDecoder {
public:
    explicit CSndfileDecoder(const SMediaFile& file);

    SDecodedMedia open() override;
    void close() override;
    int read(uint8_t* pcm, int frames) override;
    void seek(int64_t frame) override;

private:
    // How samples are read from the library.
    enum class ETransfer { raw, rawSigned8, shorts, integers24, integers32, floats, doubles };

    void chooseTransfer(int sampleFormat);

    SMediaFile m_file;
    InputFile m_input; // read by the handle
    SndfileHandle m_handle;
    SPcmFormat m_format;
    ETransfer m_transfer = ETransfer::raw;
    std::vector<int32_t> m_integers; // reused by every read
    std::vector<float> m_floats;
    std::vector<double> m_doubles;
};

} // namespace sonora2::plugins::wav
