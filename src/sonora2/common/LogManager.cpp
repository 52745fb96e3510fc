#include "sonora2/common/LogManager.h"

#include "peru/Exception.h"
#include "peru/IStreamManager.h"
#include "peru/ITimeManager.h"
#include "peru/IURI.h"
#include "peru/StringFormat.h"

#include <tinyxml.h>

#include <chrono>

namespace sonora2::common {

using peru::CMutexLock;
using peru::CString;

namespace {

std::string formatTime(int64_t milliseconds) {
    using namespace std::chrono;
    const sys_time<std::chrono::milliseconds> time{std::chrono::milliseconds(milliseconds)};
    const auto day = floor<days>(time);
    const year_month_day date{day};
    const hh_mm_ss clock{time - day};
    return CString::toStdString(peru::format(
        "%04d-%02d-%02dT%02d:%02d:%02d.%03dZ", static_cast<int>(date.year()),
        static_cast<unsigned>(date.month()), static_cast<unsigned>(date.day()),
        static_cast<int>(clock.hours().count()), static_cast<int>(clock.minutes().count()),
        static_cast<int>(clock.seconds().count()), static_cast<int>(clock.subseconds().count())));
}

} // namespace

CLogManager::CLogManager()
    : m_mutex(peru::getMutexFactory()->createMutex()), m_document(std::make_unique<TiXmlDocument>()) {
    m_document->LinkEndChild(std::make_unique<TiXmlDeclaration>("1.0", "UTF-8", "").release());
    m_document->LinkEndChild(std::make_unique<TiXmlElement>("textlog").release());
}

CLogManager::~CLogManager() = default;

void CLogManager::log(int32_t severity, const P<peru::IString>& text) {
    auto entry = std::make_unique<TiXmlElement>("logentry");
    entry->SetAttribute("time", formatTime(peru::getTimeManager()->getTime()));
    entry->SetAttribute("level", severity);
    entry->LinkEndChild(std::make_unique<TiXmlText>(CString::toStdString(text)).release());

    CMutexLock lock(m_mutex);
    TiXmlElement* root = m_document->RootElement();
    root->LinkEndChild(entry.release());
    if (m_entries < kKeptEntries)
        ++m_entries;
    else
        root->RemoveChild(root->FirstChild());
}

void CLogManager::logException(const peru::CException& exception) {
    log(kSeverityError,
        peru::format("Exception: Type='%s' Message='%s'", exception.getTitle(), exception.getDescription()));
}

P<peru::IString> CLogManager::getDocument() const {
    TiXmlPrinter printer;
    printer.SetIndent("  ");
    CMutexLock lock(m_mutex);
    m_document->Accept(&printer);
    return CString::fromUTF8(printer.Str());
}

void CLogManager::save(const P<peru::IURI>& file) const {
    const P<peru::IString> text = getDocument();
    const P<peru::IOutStream> stream = peru::getStreamManager()->getOutStream(file, peru::EOpenMode::create);
    stream->write(text->getData(), text->getDataSize());
    stream->close();
}

} // namespace sonora2::common
