#include "sonora2/boxed/RemoteLog.h"

#include "peru/Exception.h"

#include <algorithm>
#include <string_view>

namespace sonora2::common {

namespace {

constexpr char kEnd = '\x1e';
constexpr char kPart = '\x1f';
constexpr char kException = 'E';

// The text without the characters that separate entries.
std::string clean(const P<peru::IString>& text) {
    std::string bytes = peru::CString::toStdString(text);
    std::erase_if(bytes, [](char c) { return c == kEnd || c == kPart; });
    return bytes;
}

} // namespace

std::string encodeLogEntry(int32_t severity, const P<peru::IString>& text) {
    const auto level = static_cast<char>('0' + std::clamp<int32_t>(severity, kSeverityError, kSeverityTrace));
    return level + clean(text) + kEnd;
}

std::string encodeLogException(const peru::CException& exception) {
    return kException + clean(exception.getTitle()) + kPart + clean(exception.getDescription()) + kEnd;
}

void replayLog(const P<peru::IString>& entries, ILogManager& log) {
    const std::string bytes = peru::CString::toStdString(entries);
    std::string_view rest = bytes;
    while (!rest.empty()) {
        const size_t end = std::min(rest.find(kEnd), rest.size());
        std::string_view entry = rest.substr(0, end);
        rest.remove_prefix(std::min(end + 1, rest.size()));
        const char kind = entry.empty() ? ' ' : entry.front();
        if (kind == kException) {
            entry.remove_prefix(1);
            const size_t part = std::min(entry.find(kPart), entry.size());
            const std::string_view description = entry.substr(std::min(part + 1, entry.size()));
            log.logException(peru::CException(peru::CString::fromUTF8(description),
                                              peru::CString::fromUTF8(entry.substr(0, part))));
            continue;
        }
        int32_t severity = kSeverityInfo;
        if (kind >= '0' && kind <= '0' + kSeverityTrace) {
            severity = kind - '0';
            entry.remove_prefix(1);
        }
        log.log(severity, peru::CString::fromUTF8(entry));
    }
}

} // namespace sonora2::common
