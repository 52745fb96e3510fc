#include "peru/settings/ValueStoreManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/settings/XmlValueStore.h"
#include "peru/settings/posix/RegistryValueStore.h"

namespace peru {

CValueStoreManager::CValueStoreManager(std::initializer_list<P<IValueStoreFactory>> factories)
    : m_mutex(getMutexFactory()->createMutex()), m_factories(4, 4) {
    for (const P<IValueStoreFactory>& factory : factories) m_factories.add(factory);
}

CValueStoreManager::~CValueStoreManager() = default;

P<IValueStore> CValueStoreManager::openStore(const P<IURI>& uri, EStoreAccess access) {
    if (!uri) throw CInvalidArgError("uri", "IValueStoreManager::openStore");
    CMutexLock lock(m_mutex);
    // By index and with a handle of its own: a factory may add or remove factories while it is called.
    for (size_t i = 0; i < m_factories.getCount(); ++i) {
        const P<IValueStoreFactory> factory = m_factories[i];
        if (P<IValueStore> store = factory->openStore(uri, access)) return store;
    }
    return nullptr;
}

void CValueStoreManager::addFactory(const P<IValueStoreFactory>& factory) {
    if (!factory) throw CInvalidArgError("factory", "IValueStoreManager::addFactory");
    CMutexLock lock(m_mutex);
    m_factories.add(factory);
}

void CValueStoreManager::removeFactory(const P<IValueStoreFactory>& factory) {
    CMutexLock lock(m_mutex);
    for (size_t i = 0; i < m_factories.getCount(); ++i)
        if (m_factories[i] == factory) {
            m_factories.removeAt(i);
            return;
        }
}

P<IValueStoreManager> getValueStoreManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IValueStoreManager>(key, []() -> P<IValueStoreManager> {
        const P<IValueStoreFactory> xml = make<CXmlValueStoreFactory>();
        const P<IValueStoreFactory> registry = make<posix::CRegistryValueStoreFactory>();
        return make<CValueStoreManager>(std::initializer_list<P<IValueStoreFactory>>{xml, registry});
    });
}

} // namespace peru
