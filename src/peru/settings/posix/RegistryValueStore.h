// The "registry" scheme: one XML file for each base key.
#pragma once

#include "peru/settings/XmlValueStore.h"
#include "peru/threads/IMutex.h"

#include <array>
#include <string>

namespace peru::posix {

// What a "registry:" URI names.
struct SRegistryKey {
    P<IString> baseKey;
    P<IString> subKey; // with backslashes; empty for the base key itself

    // Throws CError for an unknown base key.
    static SRegistryKey parse(const P<IURI>& uri);
};

// The files are in $XDG_CONFIG_HOME/tonewright/registry. All stores below a base key share its file, across
// processes too. A change is applied to the file's current content and saved before the call returns, under a
// system-wide mutex; every read sees all saved changes. flush does nothing.
class PERU_API CRegistryValueStore : public CObject, public IValueStore {
public:
    CRegistryValueStore(const SRegistryKey& key, EStoreAccess access);
    ~CRegistryValueStore() override;

    void setString(const CStringArg& section, const CStringArg& name, const CStringArg& value) override;
    void setInt(const CStringArg& section, const CStringArg& name, int32_t value) override;
    void setInt64(const CStringArg& section, const CStringArg& name, int64_t value) override;
    void setBool(const CStringArg& section, const CStringArg& name, bool value) override;
    void setDouble(const CStringArg& section, const CStringArg& name, double value) override;
    P<IString> getString(const CStringArg& section, const CStringArg& name,
                         const P<IString>& defaultValue) override;
    int32_t getInt(const CStringArg& section, const CStringArg& name, int32_t defaultValue) override;
    int64_t getInt64(const CStringArg& section, const CStringArg& name, int64_t defaultValue) override;
    bool getBool(const CStringArg& section, const CStringArg& name, bool defaultValue) override;
    double getDouble(const CStringArg& section, const CStringArg& name, double defaultValue) override;
    bool hasValue(const CStringArg& section, const CStringArg& name) override;
    bool hasSection(const CStringArg& section) override;
    WEnum<IString> getValueNames(const CStringArg& section) override;
    WEnum<IString> getSectionNames(const CStringArg& section) override;
    void removeValue(const CStringArg& section, const CStringArg& name) override;
    void removeSection(const CStringArg& section) override;
    void flush() override;

private:
    P<IString> getPath(const CStringArg& section) const;
    // The store over the file's current content.
    CXmlValueStore& getStore();
    template <class F> void change(F&& operation);

    std::string m_path; // of the sub-key, with "/"
    EStoreAccess m_access;
    P<IURI> m_file;
    P<IMutex> m_mutex; // held from the read to the write of a change
    P<CXmlValueStore> m_store;
    // Device, inode, size and time of the file that the store was read from; all zero if there was none.
    std::array<int64_t, 5> m_identity{};
};

// Returns an empty handle for every other scheme.
class PERU_API CRegistryValueStoreFactory : public CObject, public IValueStoreFactory {
public:
    CRegistryValueStoreFactory();
    ~CRegistryValueStoreFactory() override;

    P<IValueStore> openStore(const P<IURI>& uri, EStoreAccess access) override;
};

} // namespace peru::posix
