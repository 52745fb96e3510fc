// Decodes WAV and similar containers with libsndfile.
#pragma once

#include "sonora2_wav/MissingSize.h"
#include "sonora2_wav/SndfileHandle.h"
#include "support/Decoder.h"

#include <vector>

namespace sonora2::plugins::wav {

// Linear PCM is delivered bit for bit, floating point on request, otherwise as 32 bits, compressed samples as
// the 16 bits that they were made from. A stated length that the file cannot hold is reduced to what is
// there.
class CSndfileDecoder : public IDecoder {
public:
    explicit CSndfileDecoder(const SMediaFile& file);
    ~CSndfileDecoder() override { close(); }

    // A file whose writer was killed before it stored the sizes is read to its end.
    SDecodedMedia open(const SDecoderOptions& options) override;
    void close() override;
    int read(uint8_t* pcm, int frames) override;
    void seek(int64_t frame) override;
    void deliverFloat() override { m_deliversFloat = true; }
    std::unique_ptr<IDecoder> createTwin() override; // for linear PCM

private:
    // How samples are read from the library.
    enum class ETransfer { raw, rawSigned8, shorts, integers24, integers32, floats, doubles };

    static sf_count_t getLength(void* self);
    static sf_count_t seekInput(sf_count_t offset, int whence, void* self);
    static sf_count_t readInput(void* data, sf_count_t size, void* self);
    static sf_count_t writeNothing(const void* data, sf_count_t size, void* self);
    static sf_count_t tellInput(void* self);

    void openHandle(SF_INFO& info);
    void countFrames();
    void chooseTransfer(int sampleFormat);
    int getFloatBytes() const;
    int readFloat(uint8_t* pcm, int frames);
    void findScale();
    template <class Sample> void scale(std::vector<Sample>& samples, size_t count) const;
    template <class Sample> void checkClipping(const Sample* samples, sf_count_t frames);
    void reportClipping();

    SMediaFile m_file;
    SDecoderOptions m_options;
    InputFile m_input;               // read by the handle
    int64_t m_start = 0;             // of the container, behind a tag
    std::array<SPatch, 2> m_patches; // applied to what the handle reads
    SndfileHandle m_handle;
    SPcmFormat m_format;
    int64_t m_frames = 0;
    int64_t m_position = 0; // next frame to read
    ETransfer m_transfer = ETransfer::raw;
    bool m_deliversFloat = false;
    double m_scale = 0.0;            // of floating-point samples; 0.0 until it is determined
    std::vector<int32_t> m_integers; // reused by every read
    std::vector<float> m_floats;
    std::vector<double> m_doubles;

    // Samples beyond full scale in the frames before `m_checked`.
    int64_t m_checked = 0;
    int64_t m_clipped = 0;
    double m_peak = 0.0;
};

} // namespace sonora2::plugins::wav
