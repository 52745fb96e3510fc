#include "library/HostLog.h"

#include "base/Text.h"

#include <cstdio>
#include <tonewright/host.h>

namespace host {

namespace {

void print(const TONEWRIGHT_LogMessage* message, void*) {
    static constexpr const char* kWords[] = {"trace", "debug", "info", "warning", "exception", "error"};
    const bool isKnown = message->level >= TONEWRIGHT_LOG_TRACE && message->level <= TONEWRIGHT_LOG_ERROR;
    std::string text = toPrintable(message->text);
    replaceAll(text, "\\x0a", "\n  "); // texts of several lines
    std::fprintf(stderr, "%s%s%s: %s\n", isKnown ? kWords[message->level] : "unknown",
                 *message->component ? " " : "", message->component, text.c_str());
}

} // namespace

CHostLog::CHostLog(CLibrary& library, int32_t printLevel)
    : m_library(library), m_log(TONEWRIGHT_Host_CreateLog(printLevel, print, nullptr)) {
    m_library.AddProxyLogManager(m_log.get());
}

CHostLog::~CHostLog() {
    m_library.RemoveProxyLogManager(m_log.get());
}

} // namespace host
