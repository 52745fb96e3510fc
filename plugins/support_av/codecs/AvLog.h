// What libav reports goes to the framework's log.
#pragma once

#include "sonora2/context/ILogManager.h"

namespace sonora2::plugins::av {

using peru::P;

// libav has a single log function for the process, which does not learn whose call it is in: while an object
// of this class lives, messages of the same thread go to its log. What codec threads of libav's own report is
// dropped, and nothing ever goes to standard error.
class CAvLog {
public:
    explicit CAvLog(const P<common::ILogManager>& log);
    ~CAvLog();
    CAvLog(const CAvLog&) = delete;
    CAvLog& operator=(const CAvLog&) = delete;

private:
    common::ILogManager* m_previous;
};

} // namespace sonora2::plugins::av
