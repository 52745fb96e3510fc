// A time line of audio tracks, which is a track itself.
#pragma once

#include "sonora2/tracks/IAudioTrack.h"
#include "sonora2/tracks/ITracklist.h"

namespace sonora2::audio {

class SONORA2_API IAudioTracklist : public virtual common::ITracklist, public virtual IAudioTrack {
public:
    // Declared by both bases.
    int getBufferStatus() override = 0;
    void processCommand(const P<common::ITrackCommand>& command) override = 0;
    double getDuration() override = 0;
};

} // namespace sonora2::audio
