// Clocks of this platform.
#pragma once

#include "peru/Object.h"
#include "peru/system/ITimeManager.h"

namespace peru::posix {

class CTimeManager : public CObject, public ITimeManager {
public:
    int64_t getTime() override;
    int64_t getMonotonicTime() override;
};

} // namespace peru::posix
