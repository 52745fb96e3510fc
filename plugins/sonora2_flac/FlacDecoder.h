// Reads FLAC.
#pragma once

#include "support/Decoder.h"

#include <FLAC/stream_decoder.h>

#include <vector>

namespace sonora2::plugins::flac {

// Widths that are no whole bytes are moved to the upper end of the next one: 20 bits come as 24.
// A damaged frame is an error behind what lies before it. What follows the last frame, such as a tag, is not
// looked at.
class CFlacDecoder : public IDecoder {
public:
    explicit CFlacDecoder(const SMediaFile& file);

    // A header without the length is made good by running through the file, once in the decoder's life.
    SDecodedMedia open() override;
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
    void discard(int64_t frames); // decodes and forgets
    [[noreturn]] void failDamaged() const;

    SMediaFile m_file;
    std::unique_ptr<FLAC__StreamDecoder, SDeleter> m_decoder;
    SPcmFormat m_format;
    int m_bits = 0;
    int64_t m_total = 0;    // frames
    int64_t m_scanned = -1; // frames that were counted, where the header did not tell
    int64_t m_position = 0; // frame that the next read starts with

    // What a call of the library delivers goes straight to the reader's memory; the rest waits.
    uint8_t* m_target = nullptr;
    int m_targetFrames = 0;
    int m_taken = 0;
    std::vector<uint8_t> m_rest;
    size_t m_restStart = 0;
    const char* m_damage = nullptr; // the first thing that was wrong
};

} // namespace sonora2::plugins::flac
