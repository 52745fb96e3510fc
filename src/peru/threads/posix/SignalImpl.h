// A manual-reset event.
#pragma once

#include "peru/Object.h"
#include "peru/threads/ISignal.h"

#include <pthread.h>

namespace peru::posix {

// Time-outs use the monotonic clock, so that changing the time of day does not affect them.
class CSignalImpl : public CObject, public ISignal {
public:
    CSignalImpl(); // throws CError
    ~CSignalImpl() override;
    CSignalImpl(const CSignalImpl&) = delete;
    CSignalImpl& operator=(const CSignalImpl&) = delete;

    void set() override;
    void reset() override;
    bool wait(uint32_t milliseconds) override;
    void wait() override;

private:
    pthread_cond_t m_condition;
    pthread_mutex_t m_mutex; // guards both members below
    bool m_isSet = false;
    // Releases threads that were waiting when the signal was set, even if it is reset before they run.
    uint64_t m_timesSet = 0;
};

} // namespace peru::posix
