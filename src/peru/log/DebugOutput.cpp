#include "peru/log/ILog.h"
#include "peru/log/PrintableText.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>

namespace peru {

namespace {

// Size of a trace line in characters, including the terminator.
constexpr size_t kTraceSize = 1024;

// Returns the byte size of the first `characters` characters; bytes that are not UTF-8 count at most one
// each.
size_t cut(const char* utf8, size_t size, size_t characters) {
    size_t count = 0;
    for (size_t i = 0; i < size; ++i)
        if ((utf8[i] & 0xc0) != 0x80 && count++ == characters) return i;
    return size;
}

// Like makePrintable, but in place.
void hideControls(char* utf8, size_t size) {
    for (size_t i = 0; i < size; ++i) {
        const auto byte = static_cast<unsigned char>(utf8[i]);
        const bool high = byte >= 0x80 && byte < 0xA0 && i > 0 && utf8[i - 1] == '\xC2';
        if ((byte < 0x20 && byte != '\t' && byte != '\n') || byte == 0x7F || high) utf8[i] = '?';
        if (high) utf8[i - 1] = '?';
    }
}

// Unlike a debugger's window, standard error is visible to users, so a program with its own output may switch
// this off.
bool isEnabled() {
    static const bool enabled = [] {
        const char* setting = std::getenv("TONEWRIGHT_DEBUG_OUTPUT");
        return !setting || std::string_view(setting) != "0";
    }();
    return enabled;
}

void writeDebugOutput(const char* utf8, size_t size) {
    if (!isEnabled()) return;
    // A single call, so that lines of several threads do not mix.
    std::fwrite(utf8, 1, size, stderr);
}

} // namespace

void zvrTrace(const char* file, int line, const char* comment) {
    char text[kTraceSize * 4]; // no allocation: assertions also call this when memory is exhausted
    const char* name = file ? file : "";
    int length = comment && *comment
                     ? std::snprintf(text, sizeof text, "zvr_trace: %s (%d) c=%s\n", name, line, comment)
                     : std::snprintf(text, sizeof text, "zvr_trace: %s (%d)\n", name, line);
    if (length < 0) return;
    size_t size = std::min(static_cast<size_t>(length), sizeof text - 1);
    hideControls(text, size);
    writeDebugOutput(text, cut(text, size, kTraceSize - 1));
}

void outputDebugString(const CStringArg& text) {
    std::string utf8 = makePrintable(CString::toStdString(text));
    if (!utf8.ends_with('\n')) utf8 += '\n';
    writeDebugOutput(utf8.data(), utf8.size());
}

} // namespace peru
