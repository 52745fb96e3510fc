// Clocks.
#pragma once

#include "peru/P.h"

#include <cstdint>

namespace peru {

class PERU_API ITimeManager : public virtual IBase {
public:
    virtual int64_t getTime() = 0;          // milliseconds since 1970 UTC
    virtual int64_t getMonotonicTime() = 0; // nanoseconds from an arbitrary start, never backwards
};

PERU_API P<ITimeManager> getTimeManager();

} // namespace peru
