#include "codecs/AvLog.h"

#include <cstdarg>
#include <cstdio>
#include <string_view>

extern "C" {
#include <libavutil/log.h>
}

namespace sonora2::plugins::av {

namespace {

thread_local common::ILogManager* t_log = nullptr;

void receive(void* object, int level, const char* format, va_list arguments) {
    // Failures are thrown with a message of their own; these are the details.
    if (!t_log || level > AV_LOG_WARNING) return;
    char text[512];
    int prefix = 1;
    av_log_format_line2(object, level, format, arguments, text, sizeof(text), &prefix);
    std::string_view line(text);
    while (!line.empty() && (line.back() == '\n' || line.back() == '\r')) line.remove_suffix(1);
    try {
        t_log->log(common::kSeverityDebug, peru::CString::fromUTF8(line));
    } catch (...) {
        // The caller is C code.
    }
}

} // namespace

CAvLog::CAvLog(const P<common::ILogManager>& log) : m_previous(t_log) {
    static const bool s_installed = [] {
        av_log_set_callback(&receive);
        return true;
    }();
    static_cast<void>(s_installed);
    t_log = log.get();
}

CAvLog::~CAvLog() {
    t_log = m_previous;
}

} // namespace sonora2::plugins::av
