// Cuts a decoder's chunks of varying size into chunks of one size.
#pragma once

#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/IAudioSource.h"
#include "sonora2/samplerateconverter/SampleRateConverter.h"
#include "sonora2/tracks/IAudioTrack.h"

namespace sonora2::audio {

// One thread at a time. The input must be open throughout.
class SONORA2_API CAudioChunkUnifier : public peru::CObject {
public:
    CAudioChunkUnifier(const P<common::ISonoraContext>& context, const P<IAudioTrack>& input);
    CAudioChunkUnifier(const P<common::ISonoraContext>& context, const P<common::IAudioSource>& input);
    ~CAudioChunkUnifier() override;

    // Input in another format is converted. Call before the first chunk.
    void setFormat(int sampleRate, int channelCount, int bytesPerSample);

    // Returns exactly that many frames, padding the end of the input with zeros; empty when nothing is left.
    // The timestamp is the input's.
    P<IAudioChunk> getChunk(int frames);

private:
    struct SFormat {
        int rate = 0;
        int channels = 0;
        int bytes = 0;
        bool operator==(const SFormat&) const = default;
        int64_t frameBytes() const { return int64_t{channels} * bytes; }
    };

    SFormat getInputFormat() const;
    P<IAudioChunk> fetch();
    bool advance();

    P<IAudioTrack> m_track; // either this or m_source
    P<common::IAudioSource> m_source;
    P<IAudioChunk> m_chunk; // the partly used chunk, with bytes left after the offset; or empty
    int64_t m_offset = 0;   // bytes
    P<common::ISonoraContext> m_context;
    SFormat m_format; // of the output
    P<samplerateconverter::CSampleRateConverter> m_converter;
};

} // namespace sonora2::audio
