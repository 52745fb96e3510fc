// Events that network calls can wait for together with sockets.
#pragma once

#include "peru/P.h"

#include <cstdint>

namespace peru::net {

// A manual-reset event, created unset. Safe from any thread. Unlike ISignal it can wake a thread that waits
// for a socket.
class PERU_API INetEvent : public virtual IBase {
public:
    virtual void set() = 0;
    virtual bool isSet() const = 0;
};

PERU_API P<INetEvent> createNetEvent();

// How long a call may wait: not at all (poll mode), or for a time that `cancel` ends early.
struct SNetWait {
    static constexpr int64_t kForever = -1;

    int64_t milliseconds = 0;
    P<INetEvent> cancel; // may be empty
};

} // namespace peru::net
