// Turns a decoder's frames into chunks of the wanted format.
#pragma once

#include "sonora2/context/ISonoraContext.h"
#include "sonora2/samplerateconverter/SampleRateConverter.h"
#include "support/Decoder.h"

namespace sonora2::plugins {

// Frames are counted on the delivered side. The conversion adds no delay and no tail: the total is
// round(frames * wanted rate / own rate), and a seek gives the frames that a run from the start gives.
// One thread at a time.
class CChunkProducer {
public:
    // The decoder is open, and outlives this object.
    CChunkProducer(const P<common::ISonoraContext>& context, IDecoder& decoder, const SDecodedMedia& media,
                   const SPcmFormat& wanted);

    // Whether the sample rate converter gets from one format to the other; equal formats need none.
    static bool canDeliver(const SPcmFormat& own, const SPcmFormat& wanted);
    static int64_t countDelivered(const SDecodedMedia& media, const SPcmFormat& wanted);

    void seek(int64_t frame);
    // Empty at the end. Timestamps count from `origin`.
    P<audio::IAudioChunk> next();
    void setOrigin(int64_t frame) { m_origin = frame; }
    int64_t getPosition() const { return m_position; }
    int getChunkFrames() const { return m_chunkFrames; }

private:
    P<audio::IAudioChunk> nextConverted();
    int readOwn(uint8_t* pcm, int frames);
    P<audio::IAudioChunk> makeChunk(P<peru::IMemoryBlock> block, int64_t frames);

    P<peru::IMemoryManager> m_memory;
    IDecoder& m_decoder;
    SDecodedMedia m_media;
    SPcmFormat m_wanted;
    int m_chunkFrames;      // delivered frames of a usual chunk
    int64_t m_total;        // delivered frames; falls when the file ends before it should
    int64_t m_position = 0; // delivered frame that comes next
    int64_t m_origin = 0;

    bool m_ended = false; // the decoder has no more
    int64_t m_read = 0;   // own frame that the decoder reads next

    // Only while converting.
    bool m_converting;
    P<samplerateconverter::CSampleRateConverter> m_converter;
    int m_ownChunkFrames = 0;
    int64_t m_drop = 0; // converted frames to throw away: the run-up of a seek
    bool m_flushed = false;
};

} // namespace sonora2::plugins
