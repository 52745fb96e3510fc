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

// The root "textlog" holds one "logentry" a message, with its time (UTC) and its severity as attributes. The
// document stays in memory until it is asked for; of a process that logs for days the newest entries are
// kept.
class SONORA2_API CLogManager : public peru::CObject, public ILogManager {
public:
    static constexpr int kKeptEntries = 10000;

    CLogManager();
    ~CLogManager() override;

    void log(int32_t severity, const P<peru::IString>& text) override;
    void logException(const peru::CException& exception) override; // at the worst severity

    P<peru::IString> getDocument() const; // as UTF-8 text
    // Replaces the file of the last time, which stays when the new one cannot be written. Throws CFileError.
    void save(const P<peru::IURI>& file) const;

private:
    P<peru::IMutex> m_mutex; // guards the document and the count
    P<peru::IXmlDocument> m_document;
    P<peru::IXmlNode> m_root;
    int m_entries = 0;
};

} // namespace sonora2::common
