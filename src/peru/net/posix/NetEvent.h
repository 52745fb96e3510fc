// Events and descriptors that one call waits for.
#pragma once

#include "peru/Object.h"
#include "peru/net/INetEvent.h"
#include "peru/posix/PlatformFile.h"

#include <chrono>
#include <mutex>
#include <poll.h>
#include <vector>

namespace peru::net::posix {

// Takes a descriptor only once somebody waits for it.
class CNetEvent : public CObject, public INetEvent {
public:
    CNetEvent();
    ~CNetEvent() override;

    void set() override;
    bool isSet() const override;
    // Readable as soon as the event is set, valid while the event lives. Throws CError if the process has no
    // descriptor left.
    int getDescriptor();

private:
    mutable std::mutex m_mutex; // guards both members below
    bool m_isSet = false;
    peru::posix::CFileHandle m_handle;
};

using TimePoint = std::chrono::steady_clock::time_point;

// The end of a wait that starts now; the largest time point for an endless one.
TimePoint getEnd(const SNetWait& wait);

// Waits until one of the descriptors is ready, the time has come or `cancel` is set. Returns whether a
// descriptor is ready. Does not wait if `end` has passed.
bool waitForAny(std::vector<pollfd>& descriptors, TimePoint end, const P<INetEvent>& cancel);
// The same for one event of this platform.
bool waitForEvent(CNetEvent& event, const SNetWait& wait);

} // namespace peru::net::posix
