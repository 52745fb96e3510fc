// A running thread.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"
#include "peru/threads/ISignal.h"
#include "peru/threads/IThreadManager.h"

#include <atomic>
#include <pthread.h>
#include <sys/types.h>

namespace peru::posix {

// Holds a reference to itself while running; releasing the last handle does not stop it.
class CThreadImpl : public CObject, public IThread {
public:
    static P<CThreadImpl> start(const SThreadBody& body); // throws CError
    // The calling thread's object. Threads created elsewhere get one on first use.
    static P<CThreadImpl> getCurrent();
    explicit CThreadImpl(const SThreadBody& body); // not running yet: see start()
    ~CThreadImpl() override;

    // May be called by several threads, and after the end. On return the thread's slots have been released.
    // If a thread waits for itself, because it released the last reference to its own owner, the call returns
    // at once when the body has finished and throws CInvalidObjectStateError while the body runs.
    void wait() override;
    // Does nothing once the thread has ended. A step that the user may not set becomes the nearest permitted
    // one: raising a priority, even back to its former value, is often not permitted.
    void setPriority(int step) override;

private:
    static void* enter(void* self);
    void run();
    void end() noexcept;
    friend struct SCurrentThread;

    static constexpr pid_t kNotStarted = 0;
    static constexpr pid_t kEnded = -1;

    SThreadBody m_body;
    P<IMutex> m_joinMutex; // guards m_joinable
    bool m_joinable = false;
    pthread_t m_handle{};
    P<IMutex> m_idMutex; // held while the id is used, since the system reuses the ids of ended threads
    std::atomic<pid_t> m_id{kNotStarted};
    std::atomic<bool> m_bodyEnded{false};
    P<ISignal> m_ended; // for a thread that was created elsewhere and cannot be joined
};

} // namespace peru::posix
