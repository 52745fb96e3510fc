// Clocks of this platform.
#pragma once

#include "peru/ITimeManager.h"
#include "peru/Object.h"

namespace peru::posix {

class CTimeManager : public CObject, public ITimeManager {
public:
    int64_t getTime() override;
    int64_t getMonotonicTime() override;
};

} // namespace peru::posix
