// The connection manager.
#pragma once

#include "peru/Object.h"
#include "peru/net/IConnection.h"

#include <mutex>

namespace peru::net {

class PERU_API CConnectionManager : public CObject, public IConnectionManager {
public:
    CConnectionManager();
    ~CConnectionManager() override;

    void addFactory(const P<IConnectionFactory>& factory) override;
    void removeFactory(const P<IConnectionFactory>& factory) override;
    P<IConnection> start(const Addresses& addresses) override;

private:
    std::mutex m_mutex; // guards the list, not held while a factory is asked
    std::vector<P<IConnectionFactory>> m_factories;
};

} // namespace peru::net
