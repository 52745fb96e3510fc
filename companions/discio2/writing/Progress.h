// Reports how far a write has got, and ends it if the host asks for that.
#pragma once

#include "Error.h"

#include <algorithm>

namespace discio {

class CProgress {
public:
    // `options` may be null.
    explicit CProgress(const DISCIO_WriteOptions* options)
        : m_report(options ? options->onProgress : nullptr), m_user(options ? options->user : nullptr) {}

    // Whether to go on.
    bool announce(int32_t phase, double fraction) const {
        return !m_report || m_report(m_user, phase, std::clamp(fraction, 0.0, 1.0)) != 0;
    }
    // The same; throws DISCIO_ERROR_ABORTED if not.
    void report(int32_t phase, double fraction) const {
        if (!announce(phase, fraction)) throw CDiscError(DISCIO_ERROR_ABORTED, "cancelled");
    }
    void report(int32_t phase, int64_t done, int64_t total) const {
        report(phase, total > 0 ? static_cast<double>(done) / static_cast<double>(total) : 1.0);
    }

private:
    int32_t (*m_report)(void*, int32_t, double);
    void* m_user;
};

} // namespace discio
