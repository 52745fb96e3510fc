// Reads an audio track.
#pragma once

#include "disciopp/LazyLibrary.h"
#include "support/Decoder.h"

namespace sonora2::plugins::discio {

class CTrackDecoder : public IDecoder {
public:
    explicit CTrackDecoder(const SMediaFile& file) : m_file(file) {}
    ~CTrackDecoder() override;

    SDecodedMedia open(const SDecoderOptions& options) override;
    void close() override;
    int read(uint8_t* pcm, int frames) override;
    void seek(int64_t frame) override;

private:
    // Throws the disc library's reason if the call has failed.
    void require(int32_t result) const;

    SMediaFile m_file;
    disciopp::SLoadedLibrary m_library; // with the first track
    P<disciopp::ITrackStream> m_track;  // while open
};

} // namespace sonora2::plugins::discio
