// Closes a source that was opened only to inspect it.
#pragma once

#include "sonora2/media/ISource.h"

namespace sonora2::common {

// Closes the source on leaving the scope, also by an exception. Does nothing if it is already closed; a
// caller that needs the errors of close() calls it before.
class CCloseGuard {
public:
    explicit CCloseGuard(ISource& source, bool isArmed = true) : m_source(source), m_isArmed(isArmed) {}
    ~CCloseGuard() {
        try {
            if (m_isArmed && m_source.isOpened()) m_source.close();
        } catch (...) {
            // The inspection is done, or another exception is already propagating; neither is affected.
        }
    }
    CCloseGuard(const CCloseGuard&) = delete;
    CCloseGuard& operator=(const CCloseGuard&) = delete;

private:
    ISource& m_source;
    bool m_isArmed;
};

} // namespace sonora2::common
