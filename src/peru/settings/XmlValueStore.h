// Settings in an XML file.
#pragma once

#include "peru/Object.h"
#include "peru/settings/IValueStoreManager.h"
#include "peru/xml/IXmlDocument.h"

namespace peru {

// Sections are nested elements below the root, whatever its name. Names of values and sections may start with
// "-" or a digit and contain blanks: in the file, "__L__" precedes such a first character and "__32__" stands
// for a blank; the store returns the original names. Other names that XML rejects are rejected here too. If a
// name occurs twice in a section of the file, the first occurrence counts.
class PERU_API CXmlValueStore : public CObject, public IValueStore {
public:
    enum class EMode {
        elements,  // a value is an element of its section. An empty one counts as a value and as a section.
        attributes // a value is an attribute of its section; at most IXmlDocument::kMaxProperties of them
    };

    // Opens the store at the URI, which is empty if the file is missing or empty. Throws CParseError if the
    // file is not XML, so that such a file is never overwritten.
    static P<CXmlValueStore> open(const P<IURI>& uri, EStoreAccess access, EMode mode = EMode::elements,
                                  bool autoSave = false);
    // A store over an existing document, which is saved to the URI.
    CXmlValueStore(const P<IXmlDocument>& document, const P<IURI>& uri, EStoreAccess access, EMode mode,
                   bool autoSave);
    // Changes that were not flushed are lost.
    ~CXmlValueStore() override;

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
    // Creates the folder of the file if necessary.
    void flush() override;

private:
    // Empty if there is no such section.
    P<IXmlNode> findSection(const CStringArg& section) const;
    P<IXmlNode> makeSection(const CStringArg& section);
    // The text of a value, null if there is none.
    P<IString> findValue(const CStringArg& section, const CStringArg& name) const;
    template <class T> T getNumber(const CStringArg& section, const CStringArg& name, T defaultValue) const;
    void checkWritable() const;
    void noteChange();

    P<IXmlDocument> m_document;
    P<IURI> m_uri;
    EStoreAccess m_access;
    EMode m_mode;
    bool m_autoSave;
    bool m_dirty = false;
};

// Opens files with the extension "xml"; returns an empty handle for every other URI.
class PERU_API CXmlValueStoreFactory : public CObject, public IValueStoreFactory {
public:
    explicit CXmlValueStoreFactory(CXmlValueStore::EMode mode = CXmlValueStore::EMode::elements,
                                   bool autoSave = false);
    ~CXmlValueStoreFactory() override;

    P<IValueStore> openStore(const P<IURI>& uri, EStoreAccess access) override;

private:
    CXmlValueStore::EMode m_mode;
    bool m_autoSave;
};

} // namespace peru
