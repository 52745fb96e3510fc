// Marks an operation in the log.
#pragma once

#include "peru/log/ILog.h"

namespace peru {

// Declared at the head of an operation: the log indents what follows in the scope.
class PERU_API CLogArea {
public:
    CLogArea(const P<ILog>& log, const P<IString>& name);
    // An error of a sink only goes to the debugger trace, since an exception may already be in flight.
    ~CLogArea();
    CLogArea(const CLogArea&) = delete;
    CLogArea& operator=(const CLogArea&) = delete;

private:
    P<ILog> m_log;
    P<IString> m_name;
};

} // namespace peru
