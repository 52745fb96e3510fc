#include "peru/net/ConnectionManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/net/posix/TCPConnection.h"
#include "peru/strings/IStringLocalizer.h"

#include <algorithm>

namespace peru::net {

CConnectionManager::CConnectionManager() {
    m_factories.push_back(make<posix::CTCPConnectionFactory>());
}

CConnectionManager::~CConnectionManager() = default;

void CConnectionManager::addFactory(const P<IConnectionFactory>& factory) {
    if (!factory) throw CInvalidArgError("factory", "CConnectionManager::addFactory");
    std::lock_guard lock(m_mutex);
    m_factories.push_back(factory);
}

void CConnectionManager::removeFactory(const P<IConnectionFactory>& factory) {
    std::lock_guard lock(m_mutex);
    const auto found = std::find(m_factories.begin(), m_factories.end(), factory);
    if (found != m_factories.end()) m_factories.erase(found);
}

P<IConnection> CConnectionManager::start(const Addresses& addresses) {
    std::unique_lock lock(m_mutex);
    const std::vector<P<IConnectionFactory>> factories = m_factories;
    lock.unlock();
    for (const P<IConnectionFactory>& factory : factories)
        if (P<IConnection> connection = factory->tryStart(addresses)) return connection;
    throw CError(localize("peru.net.CConnectionManager.UnsupportedAddressType",
                          "Cannot create network connection. The address type is not supported."));
}

P<IConnectionManager> getConnectionManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IConnectionManager>(
        key, []() -> P<IConnectionManager> { return make<CConnectionManager>(); });
}

} // namespace peru::net
