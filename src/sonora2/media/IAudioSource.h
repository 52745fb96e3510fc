// Audio from a URI.
#pragma once

#include "sonora2/media/IAudioChunk.h"
#include "sonora2/media/IAudioStreamInfos.h"
#include "sonora2/media/ISource.h"

namespace sonora2::common {

class SONORA2_API IAudioSource : public virtual ISource {
public:
    virtual P<audio::IAudioStreamInfos> getAudioStreamInfos() = 0;
    virtual void setAudioStream(int nAudioIndex) = 0;
    virtual P<audio::IAudioChunk> getNextAudioChunk() = 0; // empty at the end of the source
    virtual int getSampleRate() = 0;                       // frames per second
    virtual int getChannelCount() = 0;
    virtual int getBytesPerSample() = 0;
};

} // namespace sonora2::common
