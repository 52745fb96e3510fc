// Threads.
#pragma once

#include "peru/P.h"

#include <cstdint>

namespace peru {

// A runnable object.
class PERU_API IAction : public virtual IBase {
public:
    virtual void run() = 0;
};

class PERU_API IThread : public virtual IBase {
public:
    // Returns when the body has returned.
    virtual void wait() = 0;
    // Seven steps from 0 (idle) over 3 (normal) to 6 (time critical). Throws CError.
    virtual void setPriority(int step) = 0;
};

// What a thread runs. The body catches its own exceptions; one that leaves it is logged and ends the thread.
struct SThreadBody {
    PFrail<IBase> owner; // counted or not, as the owner's life demands
    void (*function)(IBase* owner, void* argument) = nullptr;
    void* argument = nullptr;
};

class PERU_API IThreadManager : public virtual IBase {
public:
    virtual P<IThread> createThread(const SThreadBody& body) = 0;  // throws CError
    virtual P<IThread> createThread(const P<IAction>& action) = 0; // holds the action while it runs
    virtual void sleep(uint32_t milliseconds) = 0;
    // Gives the processor away, for a millisecond when `longer` is set.
    virtual void yield(bool longer) = 0;
    // The running thread; a thread that this manager did not make gets an object of its own.
    virtual P<IThread> getCurrentThread() = 0;
};

PERU_API P<IThreadManager> getThreadManager();

} // namespace peru
