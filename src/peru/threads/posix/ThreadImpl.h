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

// Holds itself while it runs; dropping the last handle does not stop it.
class CThreadImpl : public CObject, public IThread {
public:
    static P<CThreadImpl> start(const SThreadBody& body); // throws CError
    // The object of the calling thread. Threads of others get one on first use.
    static P<CThreadImpl> getCurrent();
    explicit CThreadImpl(const SThreadBody& body); // not running yet: see start()
    ~CThreadImpl() override;

    // By any number of threads, also after the end. When it returns the thread's slots have been torn down.
    // A thread that drops the last handle on its own owner may end up here itself: it then returns at once,
    // where the body is done, and throws CInvalidObjectStateError while the body runs.
    void wait() override;
    // Does nothing once the thread has ended. A step that the system does not allow the user becomes the
    // nearest that it does: raising, even back to where the thread was before, often is not allowed.
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
    P<IMutex>
        m_idMutex; // held while the id is used, since the system hands out the id of an ended thread anew
    std::atomic<pid_t> m_id{kNotStarted};
    std::atomic<bool> m_bodyEnded{false};
    P<ISignal> m_ended; // of a thread that was made elsewhere and cannot be joined
};

} // namespace peru::posix
