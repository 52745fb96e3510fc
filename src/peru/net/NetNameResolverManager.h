// The name resolver manager.
#pragma once

#include "peru/Object.h"
#include "peru/net/INetNameResolver.h"

#include <mutex>

namespace peru::net {

class PERU_API CNetNameResolverManager : public CObject, public INetNameResolverManager {
public:
    CNetNameResolverManager();
    ~CNetNameResolverManager() override;

    void addResolver(const P<INetNameResolver>& resolver) override;
    void removeResolver(const P<INetNameResolver>& resolver) override;
    P<INetNameResolution> start(const P<IURI>& uri) override;
    std::vector<P<INetAddress>> resolve(const P<IURI>& uri, const P<INetEvent>& cancel) override;

private:
    std::mutex m_mutex; // guards the list, not held while a resolver is asked
    std::vector<P<INetNameResolver>> m_resolvers;
};

} // namespace peru::net
