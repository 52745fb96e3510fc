// What devices need from the system that made them.
#pragma once

#include "peru/media/ISystem.h"
#include "peru/threads/IMutex.h"

namespace peru::media::posix {

// Held by every device, so that the engine ends after the last of them.
class IPosixSystem : public virtual ISystem {
public:
    // To be held while a stream is opened or closed and while a format is tried: the engine keeps its list of
    // streams unlocked.
    virtual P<IMutex> getEngineMutex() const = 0;
};

} // namespace peru::media::posix
