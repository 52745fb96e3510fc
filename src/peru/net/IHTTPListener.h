// Progress of HTTP operations.
#pragma once

#include "peru/uri/IURI.h"

namespace peru::net {

enum class EHTTPStep {
    chooseTarget = 0,
    resolve = 1,
    startConnection = 2,
    connect = 3,
    sendRequest = 4,
    receiveHead = 5,
    receiveBody = 6,
    done = 7,
    closed = 8,
};

struct SHTTPProgress {
    EHTTPStep step;
    P<IURI> uri;          // of the current exchange, which a redirection changes
    int64_t received = 0; // bytes of the body, decoded
    int64_t total = -1;   // -1 if unknown
};

class PERU_API IHTTPListener : public virtual IBase {
public:
    // A step was entered or a part of the body was read. Called on the thread that drives the operation; may
    // cancel the operation and remove listeners.
    virtual void progressed(const SHTTPProgress& progress) = 0;
};

} // namespace peru::net
