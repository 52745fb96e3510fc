#include "peru/packages/PackageManager.h"

#include "peru/GlobalObjFactory.h"
#include "peru/packages/Package.h"
#include "peru/packages/posix/Package.h"

#include <algorithm>
#include <utility>

namespace peru {

CPackageManager::CPackageManager(std::vector<P<IPackage>> known)
    : m_mutex(getMutexFactory()->createMutex()), m_known(std::move(known)),
      m_listeners(make<TFrailArray<IPackageListener>>()) {}

CPackageManager::~CPackageManager() = default;

bool CPackageManager::contains(const CPackages& packages, const P<IPackage>& package) {
    return std::find(packages.begin(), packages.end(), package) != packages.end();
}

void CPackageManager::registerPackage(const P<IPackage>& package) {
    CMutexLock lock(m_mutex);
    if (findPackage(package->getName())) return;
    m_known.push_back(package);
    notify(package, &IPackageListener::packageRegistered);
}

P<IPackage> CPackageManager::findPackage(const CStringArg& name) {
    CMutexLock lock(m_mutex);
    for (const P<IPackage>& package : m_known)
        if (package->getName()->equals(name)) return package;
    return nullptr;
}

std::vector<P<IPackage>> CPackageManager::getPackages() {
    CMutexLock lock(m_mutex);
    return m_known;
}

void CPackageManager::activate(const P<IPackage>& package) {
    CMutexLock lock(m_mutex);
    if (contains(m_active, package) || contains(m_activating, package)) return;
    m_activating.push_back(package);
    try {
        package->checkAndLoad(*this);
    } catch (...) {
        std::erase(m_activating, package);
        throw;
    }
    std::erase(m_activating, package);
    if (contains(m_active, package)) return;
    m_active.push_back(package);
    notify(package, &IPackageListener::packageActivated);
}

void CPackageManager::notify(const P<IPackage>& package,
                             void (IPackageListener::*event)(const P<IPackage>&)) {
    // Over a copy, since a listener may remove itself or others during its call.
    std::vector<IPackageListener*> listeners;
    for (size_t i = 0; i < m_listeners->getCount(); ++i) listeners.push_back(m_listeners->at(i));
    for (IPackageListener* listener : listeners)
        if (m_listeners->contains(listener)) (listener->*event)(package);
}

bool CPackageManager::activateByName(const CStringArg& name) {
    P<IPackage> package = findPackage(name);
    if (package) activate(package);
    return static_cast<bool>(package);
}

bool CPackageManager::isActive(const P<IPackage>& package) {
    CMutexLock lock(m_mutex);
    return contains(m_active, package);
}

void CPackageManager::addListener(IPackageListener* listener) {
    CMutexLock lock(m_mutex);
    m_listeners->add(listener);
}

void CPackageManager::removeListener(IPackageListener* listener) {
    CMutexLock lock(m_mutex);
    m_listeners->remove(listener);
}

P<IPackageManager> getPackageManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IPackageManager>(key, [] {
        // Passed to the constructor rather than registered: the factory's mutex is held here, and a package
        // that loads takes it while holding the manager's mutex. Registering would lock in the opposite
        // order.
        std::vector<P<IPackage>> known{make<CPackage>(), make<posix::CPackage>()};
        return P<IPackageManager>(make<CPackageManager>(std::move(known)));
    });
}

} // namespace peru
