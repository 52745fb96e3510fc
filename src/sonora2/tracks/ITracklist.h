// A time line of tracks.
#pragma once

#include "peru/xml/IXmlDocument.h"
#include "sonora2/tracks/ITrack.h"

#include <cstdint>

namespace sonora2::common {

class SONORA2_API ITracklist : public virtual peru::IBase {
public:
    // In seconds on the list's time line. Add all tracks before playing.
    virtual void addTrack(const P<ITrack>& track, double start, double end) = 0;
    virtual double getDuration() = 0; // seconds
    virtual uint32_t getCurrentFrame() = 0;
    virtual int getBufferStatus() = 0; // the lowest of the playing tracks, 0 to 100
    virtual void processCommand(const P<ITrackCommand>& command) = 0;
    virtual void skipToFrame(uint32_t frame) = 0;
    virtual bool hasMore() = 0; // whether another step is possible
    // Advances by one step; false at the end of the list. Exceptions of a track that is due propagate.
    virtual bool step() = 0;
    virtual P<peru::IXmlDocument> getDebugDocument() = 0; // the state and all tracks
};

} // namespace sonora2::common
