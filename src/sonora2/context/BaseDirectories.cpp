#include "sonora2/context/BaseDirectories.h"

#include "peru/system/ISystem.h"
#include "peru/uri/URI.h"

namespace sonora2::common {

CBaseDirectories::CBaseDirectories()
    : m_mutex(peru::getMutexFactory()->createMutex()),
      m_pluginDirectory(peru::getSystem()->getProgramFileFolder()), m_slaveDirectory(m_pluginDirectory),
      m_dataDirectory(m_pluginDirectory) {}

CBaseDirectories::~CBaseDirectories() = default;

P<peru::IURI> CBaseDirectories::get(const P<peru::IURI>& member) const {
    peru::CMutexLock lock(m_mutex);
    return member;
}

void CBaseDirectories::set(P<peru::IURI>& member, const P<peru::IURI>& uri) {
    // Copied: the caller's object may belong to a plug-in that is unloaded earlier.
    P<peru::IURI> copy = uri ? P<peru::IURI>(peru::make<peru::CURI>(uri->getAsString())) : nullptr;
    peru::CMutexLock lock(m_mutex);
    member.swap(copy);
}

P<peru::IURI> CBaseDirectories::getPluginDirectory() {
    return get(m_pluginDirectory);
}

void CBaseDirectories::setPluginDirectory(const P<peru::IURI>& uri) {
    set(m_pluginDirectory, uri);
}

P<peru::IURI> CBaseDirectories::getSlaveDirectory() {
    return get(m_slaveDirectory);
}

void CBaseDirectories::setSlaveDirectory(const P<peru::IURI>& uri) {
    set(m_slaveDirectory, uri);
}

P<peru::IURI> CBaseDirectories::getDataDirectory() {
    return get(m_dataDirectory);
}

void CBaseDirectories::setDataDirectory(const P<peru::IURI>& uri) {
    set(m_dataDirectory, uri);
}

} // namespace sonora2::common
