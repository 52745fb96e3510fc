// Remembers what a decoder warns of.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"
#include "sonora2/context/ILogManager.h"

#include <string>

namespace sonora2::plugins {

using peru::P;

// Passes everything on to the context's log, which may be empty. Any thread.
class CWarningLog : public peru::CObject, public common::ILogManager {
public:
    explicit CWarningLog(const P<common::ILogManager>& log);
    ~CWarningLog() override;

    void log(int32_t severity, const P<peru::IString>& text) override;
    void logException(const peru::CException& exception) override;

    // The warnings since the last call, one per line. Of very many the first ones are kept.
    std::string takeWarnings();

private:
    static constexpr size_t kMostBytes = 16 * 1024;

    const P<common::ILogManager> m_log;
    const P<peru::IMutex> m_mutex; // guards the text
    std::string m_warnings;
};

} // namespace sonora2::plugins
