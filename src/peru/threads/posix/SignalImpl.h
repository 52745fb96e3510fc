// The event.
#pragma once

#include "peru/Object.h"
#include "peru/threads/ISignal.h"

#include <pthread.h>

namespace peru::posix {

// Measures time-outs on the monotonic clock, so that setting the time of day moves none of them.
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
    // Who waits when the signal is set goes on, also when it is reset before that thread comes to run.
    uint64_t m_timesSet = 0;
};

} // namespace peru::posix
