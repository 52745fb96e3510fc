// Decodes FLAC.
#pragma once

#include "support/Decoder.h"

#include <FLAC/stream_decoder.h>

#include <vector>

namespace sonora2::plugins::flac {

// Widths that are not whole bytes are left-justified in the next larger one: 20 bits are delivered as 24.
// A damaged frame is reported after the sound before it. Data after the last frame, such as a tag, is
// ignored.
class CFlacDecoder : public IDecoder {
public:
    explicit CFlacDecoder(const SMediaFile& file);

    // If the header does not state the length, the file is scanned once in the decoder's lifetime.
    SDecodedMedia open(const SDecoderOptions& options) override;
    void close() override;
    int read(uint8_t* pcm, int frames) override;
    void seek(int64_t frame) override;

private:
    struct SDeleter {
        void operator()(FLAC__StreamDecoder* decoder) const { FLAC__stream_decoder_delete(decoder); }
    };

    static FLAC__StreamDecoderWriteStatus onFrame(const FLAC__StreamDecoder* decoder,
                                                  const FLAC__Frame* frame, const FLAC__int32* const planes[],
                                                  void* self);
    static void onMetadata(const FLAC__StreamDecoder* decoder, const FLAC__StreamMetadata* block, void* self);
    static void onError(const FLAC__StreamDecoder* decoder, FLAC__StreamDecoderErrorStatus status,
                        void* self);

    bool take(const FLAC__Frame& frame, const FLAC__int32* const planes[]);
    void rewind();
    int64_t countFrames();
    void discard(int64_t frames); // decodes and drops
    [[noreturn]] void failDamaged() const;

    SMediaFile m_file;
    std::unique_ptr<FLAC__StreamDecoder, SDeleter> m_decoder;
    SPcmFormat m_format;
    int m_bits = 0;
    int64_t m_total = 0;    // frames
    int64_t m_scanned = -1; // frames counted by scanning; -1 if not scanned
    int64_t m_position = 0; // first frame of the next read

    // A decoded frame is written directly to the caller's memory; what does not fit goes to `m_rest`.
    uint8_t* m_target = nullptr;
    int m_targetFrames = 0;
    int m_taken = 0;
    std::vector<uint8_t> m_rest;
    size_t m_restStart = 0;
    const char* m_damage = nullptr; // first error reported
};

} // namespace sonora2::plugins::flac
