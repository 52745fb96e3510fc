#include "base/Text.h"

#include "base/Translation.h"

#include <tonewright/host.h>

#include <array>
#include <atomic>
#include <cctype>
#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <cwchar>
#include <locale.h>
#include <memory>
#include <sstream>
#include <stdexcept>

namespace host {

namespace {

bool isPlain(unsigned char c) {
    return std::isalnum(c) || std::string_view("/-_.~").find(static_cast<char>(c)) != std::string_view::npos;
}

int hexDigit(char c) {
    if (c >= '0' && c <= '9') return c - '0';
    if (c >= 'A' && c <= 'F') return c - 'A' + 10;
    if (c >= 'a' && c <= 'f') return c - 'a' + 10;
    return -1;
}

// Moves on by one character and returns its columns. Bytes that are not UTF-8 are shown as one column each.
size_t takeCharacter(std::string_view text, size_t& at) {
    static const locale_t kUTF8 = ::newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr);
    const locale_t old = kUTF8 ? ::uselocale(kUTF8) : nullptr;
    wchar_t character = 0;
    std::mbstate_t state = {};
    const size_t size = std::mbrtowc(&character, text.data() + at, text.size() - at, &state);
    const bool isValid = size != 0 && size <= text.size() - at;
    const int columns = isValid ? ::wcwidth(character) : 1;
    if (old) ::uselocale(old);
    at += isValid ? size : 1;
    return columns < 0 ? 1 : static_cast<size_t>(columns);
}

struct SFree {
    void operator()(void* memory) const { TONEWRIGHT_Host_Free(memory); }
};
std::atomic<int> g_outputError{0}; // errno of the first event that could not be written

template <class Char> using Owned = std::unique_ptr<Char, SFree>;

} // namespace

std::u16string toURI(const std::filesystem::path& path) {
    const Owned<char16_t> uri(TONEWRIGHT_Host_PathToURI(path.c_str()));
    if (!uri) throw std::runtime_error(tr("host.unusableName", "The name cannot be used"));
    return uri.get();
}

std::string toUTF8(const char16_t* text) {
    const Owned<char> utf8(TONEWRIGHT_Host_ToUTF8(text));
    return utf8 ? utf8.get() : "";
}

std::optional<std::u16string> toUTF16(const std::string& utf8) {
    const Owned<char16_t> text(TONEWRIGHT_Host_ToUTF16(utf8.c_str()));
    if (!text) return std::nullopt;
    return text.get();
}

std::string toPrintable(std::string_view text) {
    std::string result;
    const auto escape = [&](unsigned char c) {
        std::array<char, 8> escaped;
        std::snprintf(escaped.data(), escaped.size(), "\\x%02x", c);
        result += escaped.data();
    };
    for (size_t i = 0; i < text.size(); ++i) {
        const auto c = static_cast<unsigned char>(text[i]);
        const auto next = static_cast<unsigned char>(i + 1 < text.size() ? text[i + 1] : 0);
        if (c < 0x20 || c == 0x7F) {
            escape(c);
        } else if (c == 0xC2 && next >= 0x80 && next < 0xA0) {
            escape(c);
            escape(next);
            ++i;
        } else {
            result += text[i];
        }
    }
    return result;
}

std::string withPaths(std::string_view message) {
    static constexpr std::string_view kScheme = "file:///";
    std::string result;
    while (!message.empty()) {
        const size_t start = message.find(kScheme);
        result += message.substr(0, start);
        if (start == std::string_view::npos) break;
        message.remove_prefix(start + kScheme.size() - 1); // keeps the path's slash
        while (!message.empty() &&
               (isPlain(static_cast<unsigned char>(message[0])) ||
                std::string_view("%:@&=+$,;!*'()").find(message[0]) != std::string_view::npos)) {
            const bool escaped = message[0] == '%' && message.size() > 2 && hexDigit(message[1]) >= 0 &&
                                 hexDigit(message[2]) >= 0;
            // A quote, a colon or a bracket after the name belongs to the sentence.
            if (!escaped && std::string_view("':,;)").find(message[0]) != std::string_view::npos &&
                (message.size() == 1 || !isPlain(static_cast<unsigned char>(message[1]))))
                break;
            result +=
                escaped ? static_cast<char>(hexDigit(message[1]) << 4 | hexDigit(message[2])) : message[0];
            message.remove_prefix(escaped ? 3 : 1);
        }
    }
    return result;
}

size_t countColumns(std::string_view text) {
    size_t columns = 0;
    for (size_t at = 0; at < text.size();) columns += takeCharacter(text, at);
    return columns;
}

std::string fitColumns(std::string text, size_t columns) {
    size_t taken = 0, cut = 0;
    for (size_t at = 0; at < text.size(); cut = at) {
        const size_t width = takeCharacter(text, at);
        if (taken + width > columns) break;
        taken += width;
    }
    text.resize(cut);
    text.append(columns - taken, ' ');
    return text;
}

void replaceAll(std::string& text, const std::string& what, const std::string& with) {
    if (what.empty()) return;
    for (size_t at = 0; (at = text.find(what, at)) != std::string::npos; at += with.size())
        text.replace(at, what.size(), with);
}

namespace {

// A report of several lines, such as that of a plug-in that has crashed, as one line. The part from the list
// of calls on is of no use there; the log has all of it.
std::string toOneLine(const std::string& message) {
    if (message.find('\n') == std::string::npos) return message;
    std::string line, result;
    for (std::istringstream lines(message); std::getline(lines, line) && !line.starts_with("Calls, ");) {
        if (line.empty()) continue;
        if (!result.empty()) result += result.back() == ':' ? " " : ", ";
        result += line;
    }
    return result;
}

} // namespace

std::string asReason(std::string message, const std::filesystem::path& about) {
    message = toOneLine(message);
    const std::filesystem::path absolute = std::filesystem::absolute(about);
    bool isSentence = isEnglish(); // otherwise the first word may be the name of another file
    for (const std::string& name : {absolute.lexically_normal().native(), absolute.native()}) {
        if (message.starts_with(name + ": ")) {
            message.erase(0, name.size() + 2);
            isSentence = true;
        }
        replaceAll(message, " " + name + ":", ":");
        if (!isEnglish()) continue; // the name fits into every sentence
        for (const char* article : {"the ", "The ", ""})
            replaceAll(message, article + ("file '" + name + "'"), "this file");
        replaceAll(message, name, "this file");
    }
    for (const std::string_view stop : {".", "\u3002"})
        if (message.ends_with(stop)) message.resize(message.size() - stop.size());
    if (isSentence && !message.empty())
        message[0] = static_cast<char>(std::toupper(static_cast<unsigned char>(message[0])));
    return message;
}

bool flushOutput() {
    if (std::fflush(stdout) == 0) return true;
    if (errno == EPIPE) return false;
    throw std::runtime_error(tr("host.Standard.unwritableReason",
                                "Standard output cannot be written: %REASON%",
                                {{"%REASON%", std::strerror(errno)}}));
}

void flushEvents() {
    int none = 0;
    if (std::fflush(stdout) != 0) g_outputError.compare_exchange_strong(none, errno);
}

void requireOutput() {
    if (const int error = g_outputError; error != 0 && error != EPIPE)
        throw std::runtime_error(tr("host.Standard.unwritableReason",
                                    "Standard output cannot be written: %REASON%",
                                    {{"%REASON%", std::strerror(error)}}));
}

std::string formatDuration(double seconds) {
    const long long tenths = std::llround(seconds * 10);
    std::array<char, 48> text;
    if (tenths >= 36000)
        std::snprintf(text.data(), text.size(), "%lld:%02lld:%02lld.%lld", tenths / 36000, tenths / 600 % 60,
                      tenths / 10 % 60, tenths % 10);
    else
        std::snprintf(text.data(), text.size(), "%lld:%02lld.%lld", tenths / 600, tenths / 10 % 60,
                      tenths % 10);
    return text.data();
}

std::string formatSize(uint64_t bytes) {
    static constexpr const char* kUnits[] = {"B", "kB", "MB", "GB", "TB"};
    double value = static_cast<double>(bytes);
    size_t unit = 0;
    for (; value >= 1000 && unit + 1 < std::size(kUnits); ++unit) value /= 1000;
    std::array<char, 32> text;
    std::snprintf(text.data(), text.size(), unit == 0 ? "%.0f %s" : "%.1f %s", value, kUnits[unit]);
    return text.data();
}

} // namespace host
