#include "peru/net/NetNameResolverManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/net/posix/TCPUDPNameResolver.h"
#include "peru/strings/IStringLocalizer.h"

#include <algorithm>

namespace peru::net {

CNetNameResolverManager::CNetNameResolverManager() {
    m_resolvers.push_back(make<posix::CTCPUDPNameResolver>());
}

CNetNameResolverManager::~CNetNameResolverManager() = default;

void CNetNameResolverManager::addResolver(const P<INetNameResolver>& resolver) {
    if (!resolver) throw CInvalidArgError("resolver", "CNetNameResolverManager::addResolver");
    std::lock_guard lock(m_mutex);
    m_resolvers.push_back(resolver);
}

void CNetNameResolverManager::removeResolver(const P<INetNameResolver>& resolver) {
    std::lock_guard lock(m_mutex);
    const auto found = std::find(m_resolvers.begin(), m_resolvers.end(), resolver);
    if (found != m_resolvers.end()) m_resolvers.erase(found);
}

P<INetNameResolution> CNetNameResolverManager::start(const P<IURI>& uri) {
    if (!uri) throw CInvalidArgError("uri", "CNetNameResolverManager::start");
    std::unique_lock lock(m_mutex);
    const std::vector<P<INetNameResolver>> resolvers = m_resolvers;
    lock.unlock();
    for (const P<INetNameResolver>& resolver : resolvers)
        if (P<INetNameResolution> resolution = resolver->tryStart(uri)) return resolution;
    throw CURIError(localize("peru.net.CNetNameResolverManager.NamingSchemeNotSupported",
                             "Error resolving the network name '%URI%'. The naming scheme is not supported."),
                    uri);
}

std::vector<P<INetAddress>> CNetNameResolverManager::resolve(const P<IURI>& uri, const P<INetEvent>& cancel) {
    const P<INetNameResolution> resolution = start(uri);
    if (!resolution->isDone({SNetWait::kForever, cancel})) throw CAbortedError();
    std::vector<P<INetAddress>> addresses = resolution->getAddresses();
    if (addresses.empty())
        throw CURIError(localize("peru.net.CNetNameResolverManager.CannotResolveName",
                                 "Error resolving the network name '%URI%'."),
                        uri);
    return addresses;
}

P<INetNameResolverManager> getNetNameResolverManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<INetNameResolverManager>(
        key, []() -> P<INetNameResolverManager> { return make<CNetNameResolverManager>(); });
}

} // namespace peru::net
