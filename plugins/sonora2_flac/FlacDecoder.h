// Decodes FLAC.
#pragma once

#include "support/Decoder.h"

#include <FLAC/stream_decoder.h>

#include <vector>

namespace sonora2::plugins::flac {

// Widths that are not whole bytes are left-justified in the next larger one: 20 bits are delivered as 24.
// Tags and other data before the stream and after the last frame are ignored.
class CFlacDecoder : public IDecoder {
public:
    explicit CFlacDecoder(const SMediaFile& file);

    // If the header does not state the length, the file is scanned by the first opening, and again when it
    // has been replaced.
    SDecodedMedia open(const SDecoderOptions& options) override;
    void close() override;
    int read(uint8_t* pcm, int frames) override;
    void seek(int64_t frame) override;
    std::unique_ptr<IDecoder> createTwin() override;

private:
    struct SDeleter {
        void operator()(FLAC__StreamDecoder* decoder) const { FLAC__stream_decoder_delete(decoder); }
    };

    static FLAC__StreamDecoderReadStatus onRead(const FLAC__StreamDecoder* decoder, FLAC__byte buffer[],
                                                size_t* bytes, void* self);
    static FLAC__StreamDecoderSeekStatus onSeek(const FLAC__StreamDecoder* decoder, FLAC__uint64 offset,
                                                void* self);
    static FLAC__StreamDecoderTellStatus onTell(const FLAC__StreamDecoder* decoder, FLAC__uint64* offset,
                                                void* self);
    static FLAC__StreamDecoderLengthStatus onLength(const FLAC__StreamDecoder* decoder, FLAC__uint64* length,
                                                    void* self);
    static FLAC__bool onEof(const FLAC__StreamDecoder* decoder, void* self);
    static FLAC__StreamDecoderWriteStatus onFrame(const FLAC__StreamDecoder* decoder,
                                                  const FLAC__Frame* frame, const FLAC__int32* const planes[],
                                                  void* self);
    static void onMetadata(const FLAC__StreamDecoder* decoder, const FLAC__StreamMetadata* block, void* self);
    static void onError(const FLAC__StreamDecoder* decoder, FLAC__StreamDecoderErrorStatus status,
                        void* self);

    int64_t findStream();
    void readMetadata();
    bool take(const FLAC__Frame& frame, const FLAC__int32* const planes[]);
    int64_t getPending() const; // first frame that has not been decoded
    uint8_t getSilence() const { return m_format.bytesPerSample == 1 ? 0x80 : 0; }
    void fillGap(int64_t frames);
    void addDamage(int64_t from, int64_t frames);
    void reportDamage();
    int deliverSilence(uint8_t* pcm, int frames);
    int deliverRest(uint8_t* pcm, int frames);
    void forget(); // everything about the current position
    void rewind();
    int64_t countFrames();
    void discard(int64_t frames); // decodes and drops
    double toSeconds(int64_t frame) const { return static_cast<double>(frame) / m_format.rate; }

    SMediaFile m_file;
    SDecoderOptions m_options;
    InputFile m_input;   // read by the decoder
    int64_t m_start = 0; // offset of the stream in the file
    std::unique_ptr<FLAC__StreamDecoder, SDeleter> m_decoder;
    SPcmFormat m_format;
    int m_bits = 0;
    int64_t m_total = 0;      // frames
    int64_t m_scanned = -1;   // frames counted by scanning; -1 if not scanned
    SFileIdentity m_identity; // of the file opened last, whose frames were counted
    int64_t m_position = 0;   // first frame of the next read
    bool m_counting = false;  // frames are not delivered, only their numbers are used

    // A decoded frame is written directly to the caller's memory; what does not fit goes to `m_rest`.
    uint8_t* m_target = nullptr;
    int m_targetFrames = 0;
    int m_taken = 0;
    int64_t m_silence = 0; // frames to deliver before the rest, for sound that is missing
    std::vector<uint8_t> m_rest;
    size_t m_restStart = 0;
    int64_t m_next = -1; // number of the frame after the last one that was decoded; -1 if unknown

    const peru::SLocalizedText* m_damage = nullptr; // first error since the last good frame
    bool m_badChecksum = false;                     // the next frame is damaged
    int64_t m_damagedFrom = -1; // frames replaced by silence that have not been reported; -1 if none
    int64_t m_damagedTo = -1;
    P<peru::IString> m_change; // of the format, within the stream; empty if there is none
};

} // namespace sonora2::plugins::flac
