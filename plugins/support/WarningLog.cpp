#include "support/WarningLog.h"

#include "peru/strings/String.h"

#include <utility>

namespace sonora2::plugins {

CWarningLog::CWarningLog(const P<common::ILogManager>& log)
    : m_log(log), m_mutex(peru::getMutexFactory()->createMutex()) {}

CWarningLog::~CWarningLog() = default;

void CWarningLog::log(int32_t severity, const P<peru::IString>& text) {
    if (severity == common::kSeverityWarning) {
        peru::CMutexLock lock(m_mutex);
        if (m_warnings.size() < kMostBytes) m_warnings += peru::CString::toStdString(text) + "\n";
    }
    if (m_log) m_log->log(severity, text);
}

void CWarningLog::logException(const peru::CException& exception) {
    if (m_log) m_log->logException(exception);
}

std::string CWarningLog::takeWarnings() {
    peru::CMutexLock lock(m_mutex);
    return std::exchange(m_warnings, {});
}

} // namespace sonora2::plugins
