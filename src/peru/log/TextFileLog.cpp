#include "peru/log/TextFileLog.h"

#include "peru/log/PrintableText.h"
#include "peru/streams/IStreamManager.h"
#include "peru/system/ITimeManager.h"

#include <algorithm>
#include <cstdio>
#include <ctime>
#include <string>
#include <string_view>

namespace peru {

namespace {

const char* getLevelWord(int32_t level) {
    static const char* const words[] = {" trace", " debug", " info", " Warning", " EXCEPTION", " ERROR"};
    return level >= kLogTrace && level <= kLogError ? words[level] : " UnknownLogLevel";
}

std::string getTimeText(int64_t milliseconds) {
    if (milliseconds == -1) milliseconds = getTimeManager()->getTime();
    // Rounds down, also before 1970.
    auto seconds = static_cast<time_t>((milliseconds - (milliseconds % 1000 + 1000) % 1000) / 1000);
    std::tm local{};
    localtime_r(&seconds, &local);
    char text[40];
    std::snprintf(text, sizeof text, "%02d:%02d:%02d", local.tm_hour, local.tm_min, local.tm_sec);
    return text;
}

std::string getText(const P<IString>& text) {
    return text ? makePrintable(CString::toStdString(text)) : std::string();
}

std::string getPrefix(const SLogMessage& message, int32_t depth) {
    std::string prefix = getTimeText(message.time);
    std::string source = getText(message.source);
    if (!source.empty()) {
        for (char& ch : source) {
            if (ch == ']') ch = '_';
            if (ch == '\n' || ch == '\r') ch = ' ';
        }
        prefix += " [" + source + "]";
    }
    prefix += getLevelWord(message.level);
    prefix.append(size_t{2} * static_cast<size_t>(depth), ' ');
    return prefix + " - ";
}

size_t countCharacters(std::string_view utf8) {
    return static_cast<size_t>(
        std::count_if(utf8.begin(), utf8.end(), [](char byte) { return (byte & 0xc0) != 0x80; }));
}

// Lines end in LF, CR or CRLF; a line end after the last line does not start another one.
void appendLines(std::string& result, std::string_view text, const std::string& indentation) {
    do {
        size_t end = std::min(text.find_first_of("\r\n"), text.size());
        if (!result.ends_with(' ')) result += indentation;
        result += text.substr(0, end);
        result += '\n';
        text.remove_prefix(end);
        text.remove_prefix(text.starts_with("\r\n") ? 2 : std::min<size_t>(text.size(), 1));
    } while (!text.empty());
}

} // namespace

CTextFileLog::CTextFileLog(const P<IURI>& file, bool flushEachLine)
    : CTextFileLog(getStreamManager()->getOutStream(file, EOpenMode::append), flushEachLine) {}

CTextFileLog::CTextFileLog(const P<IOutStream>& stream, bool flushEachLine)
    : m_mutex(getMutexFactory()->createMutex()), m_stream(stream), m_flush(flushEachLine) {}

CTextFileLog::~CTextFileLog() = default;

void CTextFileLog::enterArea(const P<IString>& name) {
    CMutexLock lock(m_mutex);
    if (isWanted(kLogTrace)) write({kLogTrace, nullptr, "[Enter] - " + name, {}});
    ++m_depth;
}

void CTextFileLog::leaveArea(const P<IString>& name) {
    CMutexLock lock(m_mutex);
    m_depth = std::max(m_depth - 1, 0); // a log added within the area never saw its entry
    if (isWanted(kLogTrace)) write({kLogTrace, nullptr, "[Leave] - " + name, {}});
}

void CTextFileLog::write(const SLogMessage& message) {
    if (!isWanted(message.level)) return;
    CMutexLock lock(m_mutex);
    std::string lines = getPrefix(message, m_depth);
    const std::string indentation(countCharacters(lines), ' ');
    appendLines(lines, getText(message.text), indentation);
    for (const P<IString>& line : message.extraLines) appendLines(lines, getText(line), indentation);
    m_stream->write(lines.data(), static_cast<int64_t>(lines.size()));
    if (m_flush) m_stream->flush();
}

} // namespace peru
