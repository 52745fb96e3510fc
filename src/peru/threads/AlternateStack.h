// A second stack on which signal handlers run after a stack overflow.
#pragma once

#include "peru/Api.h"

#include <cstddef>

namespace peru {

class PERU_API CAlternateStack {
public:
    // Gives the calling thread an alternate stack until it ends, unless it has one that is large enough.
    // Handlers that are installed for it then run after an overflow of the thread's own stack. If there is no
    // memory, the thread stays without one.
    static void useForCurrentThread() noexcept;

    CAlternateStack(const CAlternateStack&) = delete;
    CAlternateStack& operator=(const CAlternateStack&) = delete;

private:
    CAlternateStack() noexcept;
    ~CAlternateStack();

    void* m_memory = nullptr;
    void* m_previous = nullptr; // restored at the end
    size_t m_previousSize = 0;
};

} // namespace peru
