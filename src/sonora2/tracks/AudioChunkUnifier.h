// Makes the uneven chunks of a decoder even.
#pragma once

#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/IAudioSource.h"
#include "sonora2/samplerateconverter/SampleRateConverter.h"
#include "sonora2/tracks/IAudioTrack.h"

namespace sonora2::audio {

// One thread at a time. The input is opened before and stays so.
class SONORA2_API CAudioChunkUnifier : public peru::CObject {
public:
    CAudioChunkUnifier(const P<common::ISonoraContext>& context, const P<IAudioTrack>& input);
    CAudioChunkUnifier(const P<common::ISonoraContext>& context, const P<common::IAudioSource>& input);
    ~CAudioChunkUnifier() override;

    // What the input gives in another format is converted. Called before the first chunk.
    void setFormat(int sampleRate, int channelCount, int bytesPerSample);

    // Always that many frames: the last chunk of the input is filled up with zeros. Empty when nothing is
    // left. The timestamp is the input's.
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

    P<IAudioTrack> m_track; // one of the two
    P<common::IAudioSource> m_source;
    P<IAudioChunk> m_chunk; // what is left of the last one; empty or with bytes behind the offset
    int64_t m_offset = 0;   // bytes
    P<common::ISonoraContext> m_context;
    SFormat m_format; // of what is handed out
    P<samplerateconverter::CSampleRateConverter> m_converter;
};

} // namespace sonora2::audio
