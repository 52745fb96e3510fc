// The framework's log as an XML document.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"
#include "sonora2/context/ILogManager.h"

namespace peru {
class IURI;
class IXmlDocument;
class IXmlNode;
} // namespace peru

namespace sonora2::common {

// The root element "textlog" holds one "logentry" per message, with its time (UTC) and severity as
// attributes. The document is kept in memory; only the newest entries are kept, so that its size stays
// bounded.
class SONORA2_API CLogManager : public peru::CObject, public ILogManager {
public:
    static constexpr int kKeptEntries = 10000;

    CLogManager();
    ~CLogManager() override;

    void log(int32_t severity, const P<peru::IString>& text) override;
    void logException(const peru::CException& exception) override; // at kSeverityError

    P<peru::IString> getDocument() const; // UTF-8
    // Replaces the file atomically. Throws CFileError and leaves the old file unchanged.
    void save(const P<peru::IURI>& file) const;

private:
    P<peru::IMutex> m_mutex; // guards the document and the count
    P<peru::IXmlDocument> m_document;
    P<peru::IXmlNode> m_root;
    int m_entries = 0;
};

} // namespace sonora2::common
