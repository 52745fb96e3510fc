#include "peru/settings/posix/RegistryValueStore.h"

#include "peru/Errors.h"
#include "peru/posix/PlatformFile.h"
#include "peru/settings/ValueBoxes.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/ISystem.h"
#include "peru/uri/URI.h"

#include <algorithm>
#include <sys/stat.h>

namespace peru::posix {

namespace {

std::array<int64_t, 5> getIdentity(const P<IURI>& file) {
    struct stat status {};
    if (::stat(toPath(file).c_str(), &status) != 0) return {};
    return {static_cast<int64_t>(status.st_dev), static_cast<int64_t>(status.st_ino), status.st_size,
            status.st_mtim.tv_sec, status.st_mtim.tv_nsec};
}

} // namespace

SRegistryKey SRegistryKey::parse(const P<IURI>& uri) {
    std::string path = CString::toStdString(CURI::unescape(uri->getSchemeSpecificPart()));
    path.erase(0, std::min(path.find_first_not_of('/'), path.size()));
    const size_t cut = std::min(path.find('/'), path.size());
    const std::string base = path.substr(0, cut);
    std::string rest = path.substr(std::min(cut + 1, path.size()));
    std::replace(rest.begin(), rest.end(), '/', '\\');
    for (const char* known : {"HKEY_CURRENT_USER", "HKEY_LOCAL_MACHINE", "HKEY_CLASSES_ROOT", "HKEY_USERS"})
        if (base == known) return {newString(known), CString::fromUTF8(rest)};
    throw CError(localize("peru.win32.CRegistryValueStore.unknownBaseKey", "Unknown registry base key: %KEY%",
                          {{"%KEY%", CString::fromUTF8(base)}}));
}

CRegistryValueStore::CRegistryValueStore(const SRegistryKey& key, EStoreAccess access)
    : m_path(CString::toStdString(key.subKey)), m_access(access),
      m_file(getSystem()->getConfigurationFolder()->appendPath(newString("tonewright/registry/") +
                                                               key.baseKey + ".xml")),
      m_mutex(
          getMutexFactory()->createGlobalMutex(newString("tonewright.registry.") + m_file->getAsString())) {
    std::replace(m_path.begin(), m_path.end(), '\\', '/');
    getStore();
}

CRegistryValueStore::~CRegistryValueStore() = default;

P<IString> CRegistryValueStore::getPath(const CStringArg& section) const {
    return CString::fromUTF8(m_path + "/" + CString::toStdString(section));
}

CXmlValueStore& CRegistryValueStore::getStore() {
    // Taken before the file is read, so that the next call notices a replacement in between.
    const std::array<int64_t, 5> identity = getIdentity(m_file);
    if (!m_store || identity != m_identity) {
        m_store = CXmlValueStore::open(m_file, m_access);
        m_identity = identity;
    }
    return *m_store;
}

template <class F> void CRegistryValueStore::change(F&& operation) {
    CMutexLock lock(m_mutex);
    try {
        CXmlValueStore& store = getStore();
        operation(store);
        store.flush();
        m_identity = getIdentity(m_file);
    } catch (...) {
        // A change that did not reach the file must not stay in memory either.
        m_store.reset();
        throw;
    }
}

void CRegistryValueStore::setString(const CStringArg& section, const CStringArg& name,
                                    const CStringArg& value) {
    change([&](CXmlValueStore& store) { store.setString(getPath(section), name, value); });
}

void CRegistryValueStore::setInt(const CStringArg& section, const CStringArg& name, int32_t value) {
    setString(section, name, CInt::formatValue(value));
}

void CRegistryValueStore::setInt64(const CStringArg& section, const CStringArg& name, int64_t value) {
    setString(section, name, CInt64::formatValue(value));
}

void CRegistryValueStore::setBool(const CStringArg& section, const CStringArg& name, bool value) {
    setString(section, name, CBool::formatValue(value));
}

void CRegistryValueStore::setDouble(const CStringArg& section, const CStringArg& name, double value) {
    setString(section, name, CDouble::formatValue(value));
}

P<IString> CRegistryValueStore::getString(const CStringArg& section, const CStringArg& name,
                                          const P<IString>& defaultValue) {
    return getStore().getString(getPath(section), name, defaultValue);
}

int32_t CRegistryValueStore::getInt(const CStringArg& section, const CStringArg& name, int32_t defaultValue) {
    return getStore().getInt(getPath(section), name, defaultValue);
}

int64_t CRegistryValueStore::getInt64(const CStringArg& section, const CStringArg& name,
                                      int64_t defaultValue) {
    return getStore().getInt64(getPath(section), name, defaultValue);
}

bool CRegistryValueStore::getBool(const CStringArg& section, const CStringArg& name, bool defaultValue) {
    return getStore().getBool(getPath(section), name, defaultValue);
}

double CRegistryValueStore::getDouble(const CStringArg& section, const CStringArg& name,
                                      double defaultValue) {
    return getStore().getDouble(getPath(section), name, defaultValue);
}

bool CRegistryValueStore::hasValue(const CStringArg& section, const CStringArg& name) {
    return getStore().hasValue(getPath(section), name);
}

bool CRegistryValueStore::hasSection(const CStringArg& section) {
    return getStore().hasSection(getPath(section));
}

WEnum<IString> CRegistryValueStore::getValueNames(const CStringArg& section) {
    return getStore().getValueNames(getPath(section));
}

WEnum<IString> CRegistryValueStore::getSectionNames(const CStringArg& section) {
    return getStore().getSectionNames(getPath(section));
}

void CRegistryValueStore::removeValue(const CStringArg& section, const CStringArg& name) {
    change([&](CXmlValueStore& store) { store.removeValue(getPath(section), name); });
}

void CRegistryValueStore::removeSection(const CStringArg& section) {
    change([&](CXmlValueStore& store) { store.removeSection(getPath(section)); });
}

void CRegistryValueStore::flush() {}

CRegistryValueStoreFactory::CRegistryValueStoreFactory() = default;

CRegistryValueStoreFactory::~CRegistryValueStoreFactory() = default;

P<IValueStore> CRegistryValueStoreFactory::openStore(const P<IURI>& uri, EStoreAccess access) {
    if (!uri->getScheme()->equalsIgnoreCase("registry")) return nullptr;
    return make<CRegistryValueStore>(SRegistryKey::parse(uri), access);
}

} // namespace peru::posix
