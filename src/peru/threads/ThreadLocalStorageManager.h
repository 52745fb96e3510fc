// The tables behind the thread-local slots.
#pragma once

#include "peru/Object.h"

#include <cstdint>

namespace peru {

// Holds a table from slot to object for each thread that has set one. Thread-safe. Values are released with
// no lock held, so their destructors may use slots.
class PERU_API CThreadLocalStorageManager : public CObject {
public:
    CThreadLocalStorageManager();
    ~CThreadLocalStorageManager() override; // releases the values of all threads

    uint64_t createSlot(); // a number that is never reused
    void removeSlot(uint64_t slot);
    P<IBase> get(uint64_t slot) const;
    void set(uint64_t slot, const P<IBase>& value);

    // Releases the calling thread's values now. Threads that this library did not create do so when they end.
    static void clearCurrentThread() noexcept;
};

PERU_API P<CThreadLocalStorageManager> getThreadLocalStorageManager();

} // namespace peru
