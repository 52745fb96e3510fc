// Marks an operation in the log.
#pragma once

#include "peru/log/ILog.h"

namespace peru {

// Opened at the head of an operation: the log shows what follows in the block indented.
class PERU_API CLogArea {
public:
    CLogArea(const P<ILog>& log, const P<IString>& name);
    // A sink that fails is not told of here, since an error may already be on its way.
    ~CLogArea();
    CLogArea(const CLogArea&) = delete;
    CLogArea& operator=(const CLogArea&) = delete;

private:
    P<ILog> m_log;
    P<IString> m_name;
};

} // namespace peru
