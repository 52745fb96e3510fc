// A time line of tracks.
#pragma once

#include "peru/xml/IXmlDocument.h"
#include "sonora2/tracks/ITrack.h"

#include <cstdint>

namespace sonora2::common {

class SONORA2_API ITracklist : public virtual peru::IBase {
public:
    // Seconds on the list's time line. A list is filled before it is played.
    virtual void addTrack(const P<ITrack>& track, double start, double end) = 0;
    virtual double getDuration() = 0; // seconds
    virtual uint32_t getCurrentFrame() = 0;
    virtual int getBufferStatus() = 0; // the lowest of what plays, 0 to 100
    virtual void processCommand(const P<ITrackCommand>& command) = 0;
    virtual void skipToFrame(uint32_t frame) = 0;
    virtual bool hasMore() = 0; // whether a step would find anything
    // Plays on by one step; false at the end of the list. Throws what a track throws that is due.
    virtual bool step() = 0;
    virtual P<peru::IXmlDocument> getDebugDocument() = 0; // the state and all tracks
};

} // namespace sonora2::common
