#include "peru/threads/posix/ThreadImpl.h"

#include "peru/Errors.h"
#include "peru/log/ILog.h"
#include "peru/posix/PlatformFile.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/threads/AlternateStack.h"
#include "peru/threads/ThreadLocalStorageManager.h"
#include "peru/threads/posix/ThreadPriority.h"

#include <cxxabi.h>
#include <unistd.h>
#include <utility>

namespace peru::posix {

// The calling thread's object. The destructor also runs at the end of threads created elsewhere.
struct SCurrentThread {
    P<CThreadImpl> thread;
    ~SCurrentThread() {
        // Emptied first, since destructors of thread-local objects may still call getCurrent().
        if (P<CThreadImpl> ending = std::move(thread)) ending->end();
    }
};

namespace {

thread_local SCurrentThread t_current;

[[noreturn]] void throwCreateError(int error) {
    P<IString> reason = error != 0 ? getSystemText(error) : CString::empty();
    if (reason->isEmpty())
        throw CError(localize("peru.CThreadImpl.createErrorUnknown", "Error creating thread."));
    throw CError(localize("peru.CThreadImpl.createError", "Error creating thread (%ERRORDESC%).",
                          {{"%ERRORDESC%", reason}}));
}

// Logs an exception that escaped a body; if logging fails, falls back to the debug output.
void logEscaped(const CException& exception) noexcept {
    try {
        getLogManager()->logException(newString("thread"), exception);
    } catch (...) {
        zvrTrace(__FILE__, __LINE__, "an exception left a thread and could not be logged");
    }
}

void runBody(const SThreadBody& body) {
    try {
        body.function(body.owner.get(), body.argument);
    } catch (const CException& exception) {
        logEscaped(exception);
    } catch (const abi::__forced_unwind&) {
        throw; // pthread_exit
    } catch (const std::exception& exception) {
        logEscaped(CError(exception.what()));
    } catch (...) {
        logEscaped(CError(""));
    }
}

} // namespace

CThreadImpl::CThreadImpl(const SThreadBody& body)
    : m_body(body), m_joinMutex(getMutexFactory()->createMutex()),
      m_idMutex(getMutexFactory()->createMutex()) {}

CThreadImpl::~CThreadImpl() {
    if (m_joinable) pthread_detach(m_handle);
}

P<CThreadImpl> CThreadImpl::start(const SThreadBody& body) {
    P<CThreadImpl> thread = make<CThreadImpl>(body);
    CMutexLock lock(thread->m_joinMutex);
    thread->addRef(); // owned by the running thread
    int error = pthread_create(&thread->m_handle, nullptr, &CThreadImpl::enter, thread.get());
    if (error != 0) {
        thread->release();
        throwCreateError(error);
    }
    thread->m_joinable = true;
    return thread;
}

P<CThreadImpl> CThreadImpl::getCurrent() {
    if (!t_current.thread) {
        P<CThreadImpl> thread = make<CThreadImpl>(SThreadBody());
        thread->m_ended = getSignalFactory()->createSignal();
        thread->m_id = gettid();
        t_current.thread = thread;
    }
    return t_current.thread;
}

void* CThreadImpl::enter(void* self) {
    P<CThreadImpl> thread(static_cast<CThreadImpl*>(self));
    CAlternateStack::useForCurrentThread();
    t_current.thread = thread;
    thread->m_id = gettid();
    thread->m_id.notify_all();
    thread->run();
    return nullptr;
}

void CThreadImpl::run() {
    runBody(m_body);
    m_bodyEnded = true;
    m_body = SThreadBody(); // this may release the last reference to the owner
    CThreadLocalStorageManager::clearCurrentThread();
}

void CThreadImpl::end() noexcept {
    {
        CMutexLock lock(m_idMutex);
        m_id = kEnded;
    }
    if (m_ended) m_ended->set();
}

void CThreadImpl::wait() {
    if (t_current.thread == P<CThreadImpl>::share(this)) {
        if (m_bodyEnded) return;
        throw CInvalidObjectStateError("a thread cannot wait for itself", P<IBase>::share(this));
    }
    if (m_ended) {
        m_ended->wait();
        return;
    }
    CMutexLock lock(m_joinMutex);
    if (!m_joinable) return;
    pthread_join(m_handle, nullptr);
    m_joinable = false;
}

void CThreadImpl::setPriority(int step) {
    m_id.wait(kNotStarted);
    CMutexLock lock(m_idMutex);
    const bool ended = m_id == kEnded;
    if (ended ? step < 0 || step > 6 : setThreadPriority(m_id, step) != 0)
        throw CError(localize("peru.CThreadImpl.priorityError", "Error setting thread priority"));
}

} // namespace peru::posix
