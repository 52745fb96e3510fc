#include "peru/log/LogArea.h"

namespace peru {

CLogArea::CLogArea(const P<ILog>& log, const P<IString>& name) : m_log(log), m_name(name) {
    m_log->enterArea(m_name);
}

CLogArea::~CLogArea() {
    try {
        m_log->leaveArea(m_name);
    } catch (...) {
        zvrTrace(__FILE__, __LINE__, "a log failed to leave an area");
    }
}

} // namespace peru
