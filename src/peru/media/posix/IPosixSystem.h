// What devices need from the system that created them.
#pragma once

#include "peru/media/ISystem.h"
#include "peru/threads/IMutex.h"

namespace peru::media::posix {

// Every device holds a reference, so that the engine is terminated after the last device.
class IPosixSystem : public virtual ISystem {
public:
    // Must be held while a stream is opened or closed and while a format is tested: the engine does not lock
    // its list of streams.
    virtual P<IMutex> getEngineMutex() const = 0;
};

} // namespace peru::media::posix
