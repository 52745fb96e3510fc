#include "peru/net/posix/ProxyManager.h"

#include "peru/GlobalObjFactory.h"
#include "peru/net/HTTPHeaders.h"
#include "peru/net/IPAddress.h"
#include "peru/net/ProxyRules.h"
#include "peru/net/posix/AddressText.h"
#include "peru/net/posix/BackgroundTask.h"
#include "peru/system/IDesktop.h"

#include <cstdlib>

namespace peru::net::posix {

namespace {

// The candidates in order of preference, as text: the thread that finds them may outlive the singletons that
// parsing needs.
using Candidates = std::vector<std::string>;

class CProxyLookUp : public CObject, public IProxyLookUp {
public:
    using CTask = TBackgroundTask<Candidates>;

    CProxyLookUp(const P<CTask>& task, int32_t defaultPort) : m_task(task), m_defaultPort(defaultPort) {}
    bool isDone(const SNetWait& wait) override { return m_task->isDone(wait); }
    P<IURI> getProxy() const override {
        if (!m_task->isDone({})) return nullptr;
        for (const std::string& candidate : m_task->getResult()) {
            if (candidate == "direct://") return nullptr;
            // Kinds that this client does not support are skipped.
            if (P<IURI> proxy = parseProxy(candidate, m_defaultPort)) return proxy;
        }
        return nullptr;
    }

private:
    P<CTask> m_task;
    const int32_t m_defaultPort;
};

bool isThisMachine(const P<IURI>& target) {
    const std::string host = getNetworkHost(target);
    if (equalsIgnoreCase(host, "localhost")) return true;
    const P<CIPAddress> address = CIPAddress::tryParse(CString::fromUTF8(host));
    return address && address->isLoopback();
}

const char* getNoProxy() {
    const char* list = std::getenv("no_proxy");
    if (!list) list = std::getenv("NO_PROXY");
    return list ? list : "";
}

} // namespace

CProxyManager::CProxyManager(int32_t defaultPort) : m_defaultPort(defaultPort) {}
CProxyManager::~CProxyManager() = default;

P<IProxyLookUp> CProxyManager::startLookUp(const P<IURI>& target) {
    using CTask = CProxyLookUp::CTask;
    // HTTP_PROXY in capitals is not read: in a web server's scripts it is a header that the client chose.
    const char* proxy = std::getenv("http_proxy");
    if (isBypassed(getNoProxy(), target) || (!proxy && isThisMachine(target)))
        return make<CProxyLookUp>(CTask::finished({}), m_defaultPort);
    if (proxy) return make<CProxyLookUp>(CTask::finished({proxy}), m_defaultPort);
    return make<CProxyLookUp>(
        CTask::start([desktop = getDesktop(), text = CString::toStdString(target->getAsString())] {
            return desktop->findProxies(text);
        }),
        m_defaultPort);
}

P<IURI> CProxyManager::getProxy(const P<IURI>& target) {
    const P<IProxyLookUp> lookUp = startLookUp(target);
    lookUp->isDone({SNetWait::kForever, nullptr});
    return lookUp->getProxy();
}

} // namespace peru::net::posix

namespace peru::net {

P<IProxyManager> getProxyManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IProxyManager>(
        key, []() -> P<IProxyManager> { return make<posix::CProxyManager>(kDefaultProxyPort); });
}

P<IProxyManager> createProxyManager(int32_t defaultPort) {
    return make<posix::CProxyManager>(defaultPort);
}

} // namespace peru::net
