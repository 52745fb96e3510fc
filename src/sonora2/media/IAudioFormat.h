// Writes audio.
#pragma once

#include "sonora2/media/IAudioChunk.h"
#include "sonora2/media/IFormat.h"

namespace sonora2::common {

class SONORA2_API IAudioFormat : public virtual IFormat {
public:
    virtual int getSampleRate() = 0;
    virtual int getChannelCount() = 0;
    virtual int getBytesPerSample() = 0;
    virtual void setAudioQuality(double fQuality) = 0;                  // 0.0 to 1.0
    virtual void setAudioBitRate(int nNominal, int nMin, int nMax) = 0; // bits per second, 0 for unspecified
    virtual void writeAudioChunk(const P<audio::IAudioChunk>& pAudioChunk) = 0;
};

} // namespace sonora2::common
