// Closes a source that was opened for a short look at it.
#pragma once

#include "sonora2/media/ISource.h"

namespace sonora2::common {

// Closes the source when the block is left, also by an exception; nothing where it is closed already, so that
// who wants to hear of a failing close calls it himself before.
class CCloseGuard {
public:
    explicit CCloseGuard(ISource& source, bool isArmed = true) : m_source(source), m_isArmed(isArmed) {}
    ~CCloseGuard() {
        try {
            if (m_isArmed && m_source.isOpened()) m_source.close();
        } catch (...) {
            // What was looked for is there, or an error is already on its way; neither is spoilt by this one.
        }
    }
    CCloseGuard(const CCloseGuard&) = delete;
    CCloseGuard& operator=(const CCloseGuard&) = delete;

private:
    ISource& m_source;
    bool m_isArmed;
};

} // namespace sonora2::common
