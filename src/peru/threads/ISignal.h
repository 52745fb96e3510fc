// Events.
#pragma once

#include "peru/P.h"

#include <cstdint>

namespace peru {

// A manual-reset event, created unset. Safe from any thread.
class PERU_API ISignal : public virtual IBase {
public:
    virtual void set() = 0;
    virtual void reset() = 0;
    // True if the signal is set or becomes set in time, false on a time-out. Does not reset it.
    virtual bool wait(uint32_t milliseconds) = 0;
    virtual void wait() = 0;
};

class PERU_API ISignalFactory : public virtual IBase {
public:
    virtual P<ISignal> createSignal() = 0; // throws CError
};

PERU_API P<ISignalFactory> getSignalFactory();

} // namespace peru
