// How many threads the process computes on.
#pragma once

#include "peru/Api.h"

#include <atomic>

namespace peru {

// Shared by all jobs of the process: one job alone may use every processor, and many at once use no more than
// there are. A job enters with the thread it runs on, which always succeeds, and asks for each further
// thread. Any thread.
class PERU_API CThreadBudget {
public:
    explicit CThreadBudget(int limit);

    int getLimit() const { return m_limit.load(std::memory_order_relaxed); }
    void setLimit(int limit); // at least 1; threads beyond a lowered limit run until they leave

    void enter() { m_used.fetch_add(1, std::memory_order_relaxed); }
    // False if every processor is in use.
    bool tryEnter();
    void leave() { m_used.fetch_sub(1, std::memory_order_relaxed); }

private:
    std::atomic<int> m_limit;
    std::atomic<int> m_used{0};
};

// The limit is the environment's TONEWRIGHT_THREADS, otherwise the number of processors that the process may
// use.
PERU_API CThreadBudget& getThreadBudget();

// The calling job's own thread, while this object lives.
class CThreadShare {
public:
    CThreadShare() { getThreadBudget().enter(); }
    ~CThreadShare() { getThreadBudget().leave(); }
    CThreadShare(const CThreadShare&) = delete;
    CThreadShare& operator=(const CThreadShare&) = delete;
};

} // namespace peru
