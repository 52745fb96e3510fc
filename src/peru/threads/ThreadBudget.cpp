#include "peru/threads/ThreadBudget.h"

#include <algorithm>
#include <cstdlib>
#include <thread>

namespace peru {

namespace {

int getDefaultLimit() {
    const char* setting = std::getenv("TONEWRIGHT_THREADS");
    const int wanted = setting ? std::atoi(setting) : 0;
    return wanted > 0 ? wanted : static_cast<int>(std::thread::hardware_concurrency());
}

} // namespace

CThreadBudget::CThreadBudget(int limit) : m_limit(std::max(limit, 1)) {}

void CThreadBudget::setLimit(int limit) {
    m_limit.store(std::max(limit, 1), std::memory_order_relaxed);
}

bool CThreadBudget::tryEnter() {
    int used = m_used.load(std::memory_order_relaxed);
    while (used < getLimit())
        if (m_used.compare_exchange_weak(used, used + 1, std::memory_order_relaxed)) return true;
    return false;
}

CThreadBudget& getThreadBudget() {
    static CThreadBudget s_budget(getDefaultLimit());
    return s_budget;
}

} // namespace peru
