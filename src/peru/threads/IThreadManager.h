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
    // Returns once the body has returned.
    virtual void wait() = 0;
    // Seven steps from 0 (idle) through 3 (normal) to 6 (time critical). Throws CError.
    virtual void setPriority(int step) = 0;
};

// What a thread runs. The body handles its own exceptions; one that escapes is logged and ends the thread.
struct SThreadBody {
    PFrail<IBase> owner; // holds a reference or not, as the owner's lifetime requires
    void (*function)(IBase* owner, void* argument) = nullptr;
    void* argument = nullptr;
};

class PERU_API IThreadManager : public virtual IBase {
public:
    virtual P<IThread> createThread(const SThreadBody& body) = 0; // throws CError
    virtual P<IThread>
    createThread(const P<IAction>& action) = 0; // holds a reference to the action while it runs
    virtual void sleep(uint32_t milliseconds) = 0;
    // Yields the processor; sleeps for a millisecond if `longer` is set.
    virtual void yield(bool longer) = 0;
    // The calling thread; a thread that this manager did not create gets an object on its first call.
    virtual P<IThread> getCurrentThread() = 0;
};

PERU_API P<IThreadManager> getThreadManager();

} // namespace peru
