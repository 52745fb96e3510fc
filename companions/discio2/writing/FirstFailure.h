// Carries an error from a thread of a library to the one that waits for it.
#pragma once

#include "Error.h"

#include <memory>
#include <mutex>

namespace discio {

// Any thread.
class CFirstFailure {
public:
    void set(const CDiscError& error) {
        const std::lock_guard lock(m_mutex);
        if (!m_error) m_error = std::make_unique<CDiscError>(error);
    }
    // Throws the first error that was set.
    void check() const {
        const std::lock_guard lock(m_mutex);
        if (m_error) throw CDiscError(*m_error);
    }
    bool isSet() const {
        const std::lock_guard lock(m_mutex);
        return m_error != nullptr;
    }

private:
    mutable std::mutex m_mutex;
    std::unique_ptr<CDiscError> m_error;
};

} // namespace discio
