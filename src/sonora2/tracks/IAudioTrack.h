// A track of audio.
#pragma once

#include "sonora2/media/IAudioChunk.h"
#include "sonora2/tracks/ITrack.h"

namespace sonora2::audio {

class SONORA2_API IAudioTrack : public virtual common::ITrack {
public:
    virtual int getSampleRate() = 0;
    virtual int getChannelCount() = 0;
    virtual int getBytesPerSample() = 0;
    virtual P<IAudioChunk> getNextAudioChunk() = 0;
};

} // namespace sonora2::audio
