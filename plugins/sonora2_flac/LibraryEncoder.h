// libFLAC's encoder with our settings.
#pragma once

#include "support/MediaFile.h"
#include "support/Pcm.h"

#include <FLAC/stream_encoder.h>

#include <memory>
#include <vector>

namespace sonora2::plugins::flac {

struct SStreamSettings {
    SPcmFormat format;
    int level = 0; // of compression, 0 to 8
};

class CLibraryEncoder {
public:
    explicit CLibraryEncoder(const SStreamSettings& settings); // throws std::bad_alloc

    FLAC__StreamEncoder* get() const { return m_encoder.get(); }
    // Before each initialisation: the library forgets its settings at the end of a stream.
    void configure();
    // Interleaved PCM. False if the library has failed.
    bool process(const uint8_t* pcm, int frames);

private:
    struct SDeleter {
        void operator()(FLAC__StreamEncoder* encoder) const { FLAC__stream_encoder_delete(encoder); }
    };

    const SStreamSettings m_settings;
    std::vector<int32_t> m_planes;
    std::unique_ptr<FLAC__StreamEncoder, SDeleter> m_encoder;
};

} // namespace sonora2::plugins::flac
