// Proxy settings.
#pragma once

#include "peru/net/INetEvent.h"
#include "peru/uri/IURI.h"

namespace peru::net {

// A look-up that runs in the background. Used by one thread at a time.
class PERU_API IProxyLookUp : public virtual IBase {
public:
    virtual bool isDone(const SNetWait& wait) = 0;
    // The proxy, with host and port and, if configured, user and password; empty for a direct connection and
    // as long as the look-up is not done.
    virtual P<IURI> getProxy() const = 0;
};

// Thread-safe.
class PERU_API IProxyManager : public virtual IBase {
public:
    virtual P<IProxyLookUp> startLookUp(const P<IURI>& target) = 0;
    // Waits for the look-up.
    virtual P<IURI> getProxy(const P<IURI>& target) = 0;
    bool isDirect(const P<IURI>& target) { return !getProxy(target); }
};

// The settings of the environment (http_proxy, no_proxy), otherwise those of the desktop. They are read with
// every look-up; nothing is loaded before the first one.
PERU_API P<IProxyManager> getProxyManager();
// The same settings for a protocol whose proxies have another port than 8080 where the settings state none.
PERU_API P<IProxyManager> createProxyManager(int32_t defaultPort);

} // namespace peru::net
