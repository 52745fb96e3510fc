// The tables behind the thread-local slots.
#pragma once

#include "peru/Object.h"

#include <cstdint>

namespace peru {

// Keeps a table from slot to object for each thread that ever set one. Safe from any thread. Values are
// released outside of every lock, so that their destructors may use slots.
class PERU_API CThreadLocalStorageManager : public CObject {
public:
    CThreadLocalStorageManager();
    ~CThreadLocalStorageManager() override; // releases what all threads hold

    uint64_t createSlot(); // a number that is never given twice
    void removeSlot(uint64_t slot);
    P<IBase> get(uint64_t slot) const;
    void set(uint64_t slot, const P<IBase>& value);

    // The calling thread's values go at once; thread ends that are not ours do the same by themselves.
    static void clearCurrentThread() noexcept;
};

PERU_API P<CThreadLocalStorageManager> getThreadLocalStorageManager();

} // namespace peru
