// What the plug-in logs, until the host fetches it.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"
#include "sonora2/context/ILogManager.h"

#include <string>

namespace slave {

using peru::P;

// Any thread. Of a plug-in that logs without end, the first entries are kept.
class CSlaveLog : public peru::CObject, public sonora2::common::ILogManager {
public:
    // Keeps entries up to that severity.
    explicit CSlaveLog(int32_t level);

    void log(int32_t severity, const P<peru::IString>& text) override;
    void logException(const peru::CException& exception) override;
    P<peru::IString> take();

private:
    void append(const std::string& entry);

    static constexpr size_t kMostBytes = 256 * 1024;

    const int32_t m_level;
    P<peru::IMutex> m_mutex; // guards the members below
    std::string m_entries;
    int64_t m_dropped = 0;
};

} // namespace slave
