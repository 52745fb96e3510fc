// Tells a slave that hangs from one that waits for a device.
#pragma once

#include "peru/Object.h"
#include "peru/system/IDynamicLibrary.h"
#include "sonora2/Api.h"

#include <cstdint>

namespace sonora2::common {

using peru::P;

// Whether a thread of the process waits for a disk, a network file system or the like, which the process can
// neither speed up nor end. Looks for up to 100 ms.
SONORA2_API bool isWaitingForDevice(int64_t process);

// Extends the deadline of a call while the slave waits for a device, such as a disk that is slow or asleep.
// Used by the thread that calls.
class CSlavePatience : public peru::CObject {
public:
    // `longest`: milliseconds that one call may take in all.
    CSlavePatience(const P<peru::IProcess>& process, uint64_t longest)
        : m_process(process), m_longest(longest) {}

    // Called before each call of the slave.
    void start(uint32_t deadline) {
        m_deadline = deadline;
        m_allowed = deadline;
    }
    // The deadline has passed; true if it starts once more.
    bool extend() {
        if (m_allowed + m_deadline > m_longest || !isWaitingForDevice(m_process->getId())) return false;
        m_allowed += m_deadline;
        return true;
    }
    uint64_t getAllowed() const { return m_allowed; } // milliseconds of the current call so far

private:
    P<peru::IProcess> m_process;
    uint64_t m_longest;
    uint64_t m_deadline = 0;
    uint64_t m_allowed = 0;
};

} // namespace sonora2::common
