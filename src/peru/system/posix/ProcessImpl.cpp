#include "peru/system/posix/ProcessImpl.h"

#include "peru/threads/IThreadManager.h"

#include <cerrno>
#include <csignal>
#include <sys/wait.h>

namespace peru::posix {

CProcessImpl::CProcessImpl(pid_t id)
    : m_id(id), m_ended(getSignalFactory()->createSignal()), m_mutex(getMutexFactory()->createMutex()) {}

void CProcessImpl::watch() {
    SThreadBody body;
    body.owner = PFrail<IBase>(this, true);
    body.argument = this;
    body.function = [](IBase*, void* argument) { static_cast<CProcessImpl*>(argument)->collect(); };
    getThreadManager()->createThread(body);
}

void CProcessImpl::collect() {
    siginfo_t info;
    int result;
    // Does not reap the child yet: its id stays reserved, so terminate() cannot signal another process.
    do result = waitid(P_PID, static_cast<id_t>(m_id), &info, WEXITED | WNOWAIT);
    while (result != 0 && errno == EINTR);
    P<IAction> action;
    {
        CMutexLock lock(m_mutex);
        int status = 0;
        if (waitpid(m_id, &status, WNOHANG) == m_id)
            m_exitCode = WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status);
        m_collected = true;
        action.swap(m_endAction);
    }
    m_ended->set();
    if (action) action->run();
}

bool CProcessImpl::wait(uint32_t milliseconds, int& exitCode) {
    if (!m_ended->wait(milliseconds)) return false;
    CMutexLock lock(m_mutex);
    exitCode = m_exitCode;
    return true;
}

void CProcessImpl::signal(int number) {
    CMutexLock lock(m_mutex);
    if (!m_collected) ::kill(m_id, number);
}

void CProcessImpl::terminate() {
    signal(SIGTERM);
}

void CProcessImpl::kill() {
    signal(SIGKILL);
}

void CProcessImpl::setEndAction(const P<IAction>& action) {
    {
        CMutexLock lock(m_mutex);
        if (!m_collected) {
            m_endAction = action;
            return;
        }
    }
    if (action) getThreadManager()->createThread(action);
}

} // namespace peru::posix
