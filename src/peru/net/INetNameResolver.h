// Name resolution.
#pragma once

#include "peru/net/INetAddress.h"
#include "peru/net/INetEvent.h"
#include "peru/uri/IURI.h"

#include <vector>

namespace peru::net {

// A resolution that runs in the background. Used by one thread at a time. A resolution that is dropped before
// it is done ends by itself.
class PERU_API INetNameResolution : public virtual IBase {
public:
    // False if it is not done by the end of the wait.
    virtual bool isDone(const SNetWait& wait) = 0;
    // All addresses in the order in which they are to be tried; none if the name is unknown or the resolution
    // is not done.
    virtual std::vector<P<INetAddress>> getAddresses() const = 0;
};

class PERU_API INetNameResolver : public virtual IBase {
public:
    // Empty for a URI that the resolver does not support. Never waits.
    virtual P<INetNameResolution> tryStart(const P<IURI>& uri) = 0;
};

// Asks its resolvers in order of registration. Thread-safe.
class PERU_API INetNameResolverManager : public virtual IBase {
public:
    virtual void addResolver(const P<INetNameResolver>& resolver) = 0;
    virtual void removeResolver(const P<INetNameResolver>& resolver) = 0;
    // Throws CURIError if no resolver supports the URI's scheme.
    virtual P<INetNameResolution> start(const P<IURI>& uri) = 0;
    // Waits for the addresses. Throws CURIError if there are none, CAbortedError on a cancel.
    virtual std::vector<P<INetAddress>> resolve(const P<IURI>& uri, const P<INetEvent>& cancel = nullptr) = 0;
};

// Supports URIs with a host: "http", and "tcp" and "udp" with a port.
PERU_API P<INetNameResolverManager> getNetNameResolverManager();

} // namespace peru::net
