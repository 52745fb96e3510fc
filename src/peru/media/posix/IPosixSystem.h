// What devices need from the system that created them.
#pragma once

#include "peru/media/ISystem.h"
#include "peru/threads/IMutex.h"

namespace peru::media::posix {

// Every device holds a reference, so that the engine is terminated after the last device.
class IPosixSystem : public virtual ISystem {
public:
    // Must be held while devices are enumerated, a stream is opened or closed or a format is tested: the
    // engine has no locks of its own.
    virtual P<IMutex> getEngineMutex() const = 0;
    // The rest requires the mutex. The generation changes when the engine's device indices may have changed.
    virtual uint64_t getGeneration() const = 0;
    // A stream was opened or closed: the engine cannot be restarted while there are any.
    virtual void countStream(int difference) = 0;
};

} // namespace peru::media::posix
