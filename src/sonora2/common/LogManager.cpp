#include "sonora2/common/LogManager.h"

#include "peru/Exception.h"
#include "peru/ISystem.h"
#include "peru/ITimeManager.h"
#include "peru/IURI.h"
#include "peru/StringFormat.h"

#include <tinyxml.h>

#include <algorithm>
#include <chrono>
#include <string>
#include <string_view>

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

// Bytes of the well-formed UTF-8 sequence at the start of the text that XML may hold; 0 where there is none.
// Strings hand out their bytes as they came, so nothing can be taken for granted.
size_t measureCharacter(std::string_view text) {
    const auto byte = [&](size_t index) { return static_cast<uint8_t>(text[index]); };
    const uint8_t lead = byte(0);
    if (lead < 0x80) return lead >= 0x20 || lead == '\t' || lead == '\n' || lead == '\r' ? 1 : 0;
    const size_t size = lead >= 0xf0 ? 4 : lead >= 0xe0 ? 3 : 2;
    if (lead < 0xc2 || lead > 0xf4 || text.size() < size) return 0;
    char32_t ch = lead & (0xff >> (size + 1));
    for (size_t i = 1; i < size; ++i) {
        if ((byte(i) & 0xc0) != 0x80) return 0;
        ch = ch << 6 | (byte(i) & 0x3f);
    }
    const char32_t smallest = size == 2 ? 0x80 : size == 3 ? 0x800 : 0x10000;
    const bool surrogate = ch >= 0xd800 && ch <= 0xdfff;
    return ch < smallest || ch > 0x10ffff || surrogate || ch == 0xfffe || ch == 0xffff ? 0 : size;
}

// Messages carry names from files and devices: one bad name must not spoil the document.
std::string makeReadable(const P<peru::IString>& text) {
    std::string readable = CString::toStdString(text);
    for (size_t at = 0; at < readable.size();) {
        const size_t size = measureCharacter(std::string_view(readable).substr(at));
        if (size == 0) readable[at] = '?';
        at += std::max<size_t>(size, 1);
    }
    return readable;
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
    peru::getSystem()->replaceFile(file, text->getData(), static_cast<int64_t>(text->getDataSize()));
}

} // namespace sonora2::common
