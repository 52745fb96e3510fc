#include "sonora2/context/LogManager.h"

#include "peru/Exception.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/ISystem.h"
#include "peru/system/ITimeManager.h"
#include "peru/uri/IURI.h"
#include "peru/xml/XmlDocument.h"
#include "peru/xml/XmlText.h"

#include <algorithm>
#include <chrono>
#include <string>
#include <string_view>

namespace sonora2::common {

using peru::CMutexLock;
using peru::CString;

namespace {

P<peru::IString> formatTime(int64_t milliseconds) {
    using namespace std::chrono;
    const sys_time<std::chrono::milliseconds> time{std::chrono::milliseconds(milliseconds)};
    const auto day = floor<days>(time);
    const year_month_day date{day};
    const hh_mm_ss clock{time - day};
    return peru::format("%04d-%02d-%02dT%02d:%02d:%02d.%03dZ", static_cast<int>(date.year()),
                        static_cast<unsigned>(date.month()), static_cast<unsigned>(date.day()),
                        static_cast<int>(clock.hours().count()), static_cast<int>(clock.minutes().count()),
                        static_cast<int>(clock.seconds().count()),
                        static_cast<int>(clock.subseconds().count()));
}

// Messages contain names of files and devices: an invalid name must not make the document malformed.
P<peru::IString> makeReadable(const P<peru::IString>& text) {
    std::string readable = CString::toStdString(text);
    for (size_t at = 0; at < readable.size();) {
        const size_t size = peru::measureXmlCharacter(std::string_view(readable).substr(at, 4));
        if (size == 0) readable[at] = '?';
        at += std::max<size_t>(size, 1);
    }
    return CString::fromUTF8(readable);
}

} // namespace

CLogManager::CLogManager()
    : m_mutex(peru::getMutexFactory()->createMutex()), m_document(peru::make<peru::CXmlDocument>()),
      m_root(m_document->addChildNode("textlog")) {}

CLogManager::~CLogManager() = default;

void CLogManager::log(int32_t severity, const P<peru::IString>& text) {
    const P<peru::IString> time = formatTime(peru::getTimeManager()->getTime());
    const P<peru::IString> readable = makeReadable(text);

    CMutexLock lock(m_mutex);
    const P<peru::IXmlNode> entry = m_root->addChildNode("logentry");
    entry->setProperty("time", time);
    entry->setProperty("level", peru::format("%d", severity));
    entry->setText(readable);
    if (m_entries < kKeptEntries)
        ++m_entries;
    else
        m_root->removeChildNode(m_root->getChildNode("logentry"));
}

void CLogManager::logException(const peru::CException& exception) {
    log(kSeverityError,
        peru::format("Exception: Type='%s' Message='%s'", exception.getTitle(), exception.getDescription()));
}

P<peru::IString> CLogManager::getDocument() const {
    CMutexLock lock(m_mutex);
    return m_document->printToString()->toUTF8String();
}

void CLogManager::save(const P<peru::IURI>& file) const {
    const P<peru::IString> text = getDocument();
    peru::getSystem()->replaceFile(file, text->getData(), static_cast<int64_t>(text->getDataSize()));
}

} // namespace sonora2::common
