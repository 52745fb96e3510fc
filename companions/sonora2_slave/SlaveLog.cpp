#include "sonora2_slave/SlaveLog.h"

#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/boxed/RemoteLog.h"

#include <utility>

namespace slave {

using namespace sonora2::common;

CSlaveLog::CSlaveLog(int32_t level) : m_level(level), m_mutex(peru::getMutexFactory()->createMutex()) {}

void CSlaveLog::append(const std::string& entry) {
    const peru::CMutexLock lock(m_mutex);
    if (m_dropped > 0 || m_entries.size() + entry.size() > kMostBytes)
        ++m_dropped;
    else
        m_entries += entry;
}

void CSlaveLog::log(int32_t severity, const P<peru::IString>& text) {
    if (severity <= m_level && text) append(encodeLogEntry(severity, text));
}

void CSlaveLog::logException(const peru::CException& exception) {
    append(encodeLogException(exception));
}

P<peru::IString> CSlaveLog::take() {
    std::string entries;
    int64_t dropped;
    {
        const peru::CMutexLock lock(m_mutex);
        entries = std::exchange(m_entries, {});
        dropped = std::exchange(m_dropped, 0);
    }
    if (dropped > 0)
        entries += encodeLogEntry(kSeverityWarning,
                                  peru::localize("sonora2.CSlaveLog.dropped",
                                                 "%COUNT% more log entries of the plug-in were dropped.",
                                                 {{"%COUNT%", peru::format("%d", dropped)}}));
    return peru::CString::fromUTF8(entries);
}

} // namespace slave
