#include "sonora2/common/LogManager.h"

#include "peru/Exception.h"
#include "peru/IStreamManager.h"
#include "peru/ITimeManager.h"
#include "peru/IURI.h"
#include "peru/StringFormat.h"

#include <tinyxml.h>

#include <chrono>
#include <string>

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

// Messages carry names from files and devices. What XML cannot hold, even escaped, becomes '?', and malformed
// bytes are left out: one bad name must not spoil the document.
std::string makeReadable(const P<peru::IString>& text) {
    std::string readable;
    if (!text) return readable;
    for (peru::SStringPos pos = peru::kStringBegin;;) {
        char32_t ch = text->getCharAndAdvance(pos);
        if (!pos.isFound()) return readable;
        const bool allowed = ch == '\t' || ch == '\n' || ch == '\r' || (ch >= 0x20 && ch < 0xd800) ||
                             (ch >= 0xe000 && ch < 0xfffe) || (ch >= 0x10000 && ch <= 0x10ffff);
        if (!allowed) ch = '?';
        if (ch < 0x80) {
            readable += static_cast<char>(ch);
            continue;
        }
        const int following = ch < 0x800 ? 1 : ch < 0x10000 ? 2 : 3;
        readable += static_cast<char>((0xff00 >> (following + 1)) | (ch >> (6 * following)));
        for (int i = following - 1; i >= 0; --i) readable += static_cast<char>(0x80 | (ch >> (6 * i) & 0x3f));
    }
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
    entry->LinkEndChild(std::make_unique<TiXmlText>(makeReadable(text)).release());

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
