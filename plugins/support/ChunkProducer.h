// Turns a decoder's frames into chunks of the requested format.
#pragma once

#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/IAudioChunk.h"
#include "support/Decoder.h"
#include "support/FormatConverter.h"

#include <exception>
#include <optional>

namespace sonora2::plugins {

// Positions count delivered frames. The conversion adds no delay and no tail: the total is
// round(frames * requested rate / file's rate), and a seek delivers the same samples as a run from the start.
// Not safe for concurrent use.
class CChunkProducer {
public:
    // The decoder must be open and outlive this object.
    CChunkProducer(const P<common::ISonoraContext>& context, const SMediaFile& file, IDecoder& decoder,
                   const SDecodedMedia& media, const SPcmFormat& wanted, const SDecoderOptions& options);

    // Throws if there is no conversion between the two formats. Equal formats need none.
    static void requireDeliverable(const SMediaFile& file, const SPcmFormat& own, const SPcmFormat& wanted);
    static int64_t countDelivered(const SDecodedMedia& media, const SPcmFormat& wanted);

    void seek(int64_t frame);
    // Empty at the end. A failure of the decoder, or an end before the stated length, is thrown after
    // everything that could be decoded before it; then the chunks end.
    // Timestamps count from `origin`.
    P<audio::IAudioChunk> next();
    void setOrigin(int64_t frame) { m_origin = frame; }
    int64_t getPosition() const { return m_position; }
    int getChunkFrames() const { return m_chunkFrames; }

private:
    P<audio::IAudioChunk> nextPlain();
    P<audio::IAudioChunk> nextConverted();
    int readOwn(uint8_t* pcm, int frames);
    void reportEarlyEnd() const;
    P<audio::IAudioChunk> makeChunk(P<peru::IMemoryBlock> block, int64_t frames);

    P<peru::IMemoryManager> m_memory;
    SMediaFile m_file;
    IDecoder& m_decoder;
    SDecoderOptions m_options;
    SDecodedMedia m_media;
    SPcmFormat m_wanted;
    int m_chunkFrames;      // delivered frames per chunk
    const int64_t m_total;  // delivered frames; unlimited if the decoder only estimates them
    int64_t m_end;          // where delivery ends; before m_total if the decoder stopped early
    int64_t m_position = 0; // next frame to deliver
    int64_t m_origin = 0;

    bool m_ended = false;         // the decoder has reached its end or has failed
    std::exception_ptr m_failure; // to be thrown after the frames before it
    int64_t m_read = 0;           // frame that the decoder reads next

    // Only while converting.
    bool m_converting;
    std::optional<CFormatConverter> m_converter;
    int m_ownChunkFrames = 0;
    int64_t m_drop = 0; // converted frames to discard after a seek
    bool m_flushed = false;
};

} // namespace sonora2::plugins
