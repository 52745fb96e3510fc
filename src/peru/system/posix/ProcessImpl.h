// A child process.
#pragma once

#include "peru/Object.h"
#include "peru/system/IDynamicLibrary.h"
#include "peru/threads/IMutex.h"
#include "peru/threads/ISignal.h"

#include <sys/types.h>

namespace peru::posix {

// A dedicated thread waits for the child, so that it is reaped even if nobody calls wait().
class CProcessImpl : public CObject, public IProcess {
public:
    explicit CProcessImpl(pid_t id);

    // Starts the waiting thread, which holds a reference to the object until the child has ended. Throws
    // CError.
    void watch();

    int64_t getId() const override { return m_id; }
    // The exit code is 128 plus the signal's number for a child that was killed by a signal, and -1 if other
    // code in this program reaped the child.
    bool wait(uint32_t milliseconds, int& exitCode) override;
    void terminate() override; // sends SIGTERM; does nothing if the child has ended
    void kill() override;
    void setEndAction(const P<IAction>& action) override; // runs on the waiting thread if set in time

    // Waits for the child to end and reaps it.
    void collect();

private:
    void signal(int number);

    const pid_t m_id;
    P<ISignal> m_ended;
    P<IMutex> m_mutex;        // guards the members below and is held while the id is used
    bool m_collected = false; // reaped; the system may reuse the id
    int m_exitCode = -1;
    P<IAction> m_endAction;
};

} // namespace peru::posix
