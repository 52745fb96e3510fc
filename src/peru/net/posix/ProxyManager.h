// The proxy settings of this platform.
#pragma once

#include "peru/Object.h"
#include "peru/net/IProxyManager.h"

namespace peru::net::posix {

// If http_proxy is set, even to an empty text, it decides together with no_proxy. Otherwise the desktop's
// settings apply; since they may be a script that has to be loaded first, they are asked on a thread of their
// own. This machine itself never goes through the desktop's proxy.
class PERU_API CProxyManager : public CObject, public IProxyManager {
public:
    explicit CProxyManager(int32_t defaultPort);
    ~CProxyManager() override;

    P<IProxyLookUp> startLookUp(const P<IURI>& target) override;
    P<IURI> getProxy(const P<IURI>& target) override;

private:
    const int32_t m_defaultPort;
};

} // namespace peru::net::posix
