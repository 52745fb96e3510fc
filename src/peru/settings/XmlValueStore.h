// Settings in an XML file.
#pragma once

#include "peru/Object.h"
#include "peru/settings/IValueStoreManager.h"
#include "peru/xml/IXmlDocument.h"

namespace peru {

// Sections are nested elements below the root, whatever its name. Names of values and sections may begin with
// "-" or a digit and hold blanks: the file has "__L__" before such a first character and "__32__" for a
// blank, and gives the names back as they were. What XML otherwise refuses in a name is refused here. A name
// that occurs twice in one section of the file is its first occurrence.
class PERU_API CXmlValueStore : public CObject, public IValueStore {
public:
    enum class EMode {
        elements,  // a value is an element of its section. An empty one counts as a value and as a section.
        attributes // a value is an attribute of its section; at most IXmlDocument::kMaxProperties of them
    };

    // What is read from the URI, empty when there is no such file or nothing in it. Throws CParseError for a
    // file that is no XML, which is then never written over.
    static P<CXmlValueStore> open(const P<IURI>& uri, EStoreAccess access, EMode mode = EMode::elements,
                                  bool autoSave = false);
    // Over a document that is there; the URI says where it is saved.
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
    // Makes the folder of the file if need be.
    void flush() override;

private:
    // Empty where there is no such section.
    P<IXmlNode> findSection(const CStringArg& section) const;
    P<IXmlNode> makeSection(const CStringArg& section);
    // The text of a value, null where there is none.
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

// Files whose extension is "xml"; every other URI is left to others.
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
