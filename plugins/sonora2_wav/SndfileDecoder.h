// Reads the plain sound containers.
#pragma once

#include "support/Decoder.h"

#include <sndfile.h>

#include <vector>

namespace sonora2::plugins::wav {

struct SSndfileCloser {
    void operator()(SNDFILE* file) const { sf_close(file); }
};
using SndfileHandle = std::unique_ptr<SNDFILE, SSndfileCloser>;

// Linear PCM is delivered bit for bit, floating point as 32 bits, what was compressed as the 16 bits that it
// is made for. A length in the header that the file cannot hold is cut to what is there.
class CSndfileDecoder : public IDecoder {
public:
    explicit CSndfileDecoder(const SMediaFile& file);

    SDecodedMedia open() override;
    void close() override;
    int read(uint8_t* pcm, int frames) override;
    void seek(int64_t frame) override;

private:
    // How the library's samples become ours.
    enum class ETransfer { raw, rawSigned8, shorts, integers24, integers32, floats, doubles };

    void chooseTransfer(int sampleFormat);

    SMediaFile m_file;
    InputFile m_input; // under the handle
    SndfileHandle m_handle;
    SPcmFormat m_format;
    ETransfer m_transfer = ETransfer::raw;
    std::vector<int32_t> m_integers; // reused by every read
    std::vector<float> m_floats;
    std::vector<double> m_doubles;
};

} // namespace sonora2::plugins::wav
