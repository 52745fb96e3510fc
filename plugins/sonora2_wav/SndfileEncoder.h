// Encodes AIFF, AU, CAF, W64 and RF64 with libsndfile.
#pragma once

#include "sonora2_wav/SndfileDecoder.h"
#include "support/Encoder.h"

#include <string>

namespace sonora2::plugins::wav {

class CSndfileEncoder : public IEncoder {
public:
    // An extension of AIFF, AIFC, AU, CAF, W64 or RF64.
    explicit CSndfileEncoder(const std::string& extension);

    bool accepts(const SPcmFormat& format) const override;
    uint32_t getUsedSettings() const override { return common::IFormatSettings::kSampleWidth; }
    void open(COutputFile& file, const SEncoderSettings& settings) override;
    void write(const uint8_t* pcm, int frames) override;
    void update() override;
    void finish() override;
    int64_t estimateBytes(double seconds, const SEncoderSettings& settings) const override; // exact
    bool holdsFloat(const SPcmFormat& format) const override;

private:
    struct SContainer;

    static const SContainer& findContainer(const std::string& extension);
    void correctSizes();
    SF_INFO describe(const SPcmFormat& format) const;

    const SContainer& m_container;
    SPcmFormat m_format;
    COutputFile* m_file = nullptr;
    SndfileHandle m_handle;
    bool m_swapped = false; // the container's byte order differs from the host's
    int64_t m_bytes = 0;    // sample bytes written so far
    std::vector<int32_t> m_integers;
    std::vector<uint8_t> m_signed8;
};

} // namespace sonora2::plugins::wav
