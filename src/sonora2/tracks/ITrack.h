// A source with effects and a position in time.
#pragma once

#include "peru/uri/IURI.h"
#include "sonora2/Api.h"

namespace sonora2 {

class SONORA2_API IBuffer {
public:
    virtual int getBufferStatus() = 0;

protected:
    ~IBuffer() = default;
};

} // namespace sonora2

namespace sonora2::common {

using peru::P;

class SONORA2_API ITrackCommand : public virtual peru::IBase {
public:
    virtual P<peru::IString> getCommandName() const = 0;   // the class's own name
    virtual P<peru::IString> getCommandTarget() const = 0; // a track's id; empty for all tracks
    virtual P<ITrackCommand> cloneCommand() const = 0;
};

class SONORA2_API IProcessCommand {
public:
    virtual void processCommand(const P<ITrackCommand>& command) = 0;

protected:
    ~IProcessCommand() = default;
};

class SONORA2_API ITrack : public virtual peru::IBase,
                           public virtual IBuffer,
                           public virtual IProcessCommand {
public:
    virtual P<peru::IURI> getURI() = 0; // empty for a silent track
    virtual void setURI(const P<peru::IURI>& uri) = 0;
    virtual bool isOpened() = 0;
    virtual void open() = 0;
    virtual void close() = 0;
    virtual int getSortIndex() = 0;    // the lane of the track in its list
    virtual double getStartTime() = 0; // seconds on its list's time line
    virtual double getDuration() = 0;  // seconds on that time line
    virtual bool isEnabled() = 0;
    virtual P<peru::IString> getDebugText() = 0;
};

} // namespace sonora2::common
