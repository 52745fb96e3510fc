// Keeps the desktop from mounting and opening discs while the program runs.
#pragma once

#include "peru/Object.h"
#include "peru/system/IDynamicLibrary.h"

namespace cap {

using peru::P;

// The work is done by a companion process, which ends with this object and with this process.
class CCancelAutoplay2 : public peru::CObject {
public:
    // Starts the companion and does not wait for it. Throws peru::CError, which names its file.
    CCancelAutoplay2();
    ~CCancelAutoplay2() override;

private:
    P<peru::IProcess> m_process;
};

} // namespace cap
