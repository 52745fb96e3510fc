// Work in parts, on the processors that are idle.
#pragma once

#include "peru/threads/ThreadBudget.h"

#include <cstddef>
#include <functional>

namespace peru {

// Threads beside the calling one that the process may use while this object lives; possibly none.
class PERU_API CIdleThreads {
public:
    explicit CIdleThreads(int most);
    ~CIdleThreads();
    CIdleThreads(const CIdleThreads&) = delete;
    CIdleThreads& operator=(const CIdleThreads&) = delete;

    int getCount() const { return m_count; }

private:
    int m_count = 0;
};

struct SOrderedParts {
    size_t count = 0;
    size_t window = 1; // parts that are worked on or wait for their delivery at a time, at least 1
    int helpers = 0;   // threads beside the calling one
    // Called on any thread for each part, in order; must not throw. Worker 0 is the calling thread, the
    // helpers follow.
    std::function<void(size_t part, int worker)> work;
    // Called on the calling thread for each part, in order, after its work. False ends the rest.
    std::function<bool(size_t part)> deliver;
};

// True if every part has been delivered. Throws what `deliver` throws. No work is left running.
PERU_API bool runInOrder(const SOrderedParts& parts);

} // namespace peru
