// A child process.
#pragma once

#include "peru/Object.h"
#include "peru/system/IDynamicLibrary.h"
#include "peru/threads/IMutex.h"
#include "peru/threads/ISignal.h"

#include <sys/types.h>

namespace peru::posix {

// A thread of its own waits for the child, so that an ended one is collected also when nobody asks.
class CProcessImpl : public CObject, public IProcess {
public:
    explicit CProcessImpl(pid_t id);

    // Starts the collecting thread, which holds the object until the child has ended. Throws CError.
    void watch();

    int64_t getId() const override { return m_id; }
    // The exit code of a child that a signal ended is 128 and the signal's number; -1 when somebody else in
    // the program collected it.
    bool wait(uint32_t milliseconds, int& exitCode) override;
    void terminate() override; // asks by SIGTERM; does nothing when the child has ended

    // Returns when the child has ended.
    void collect();

private:
    const pid_t m_id;
    P<ISignal> m_ended;
    P<IMutex> m_mutex;        // guards the members below, and is held while the id is used
    bool m_collected = false; // the system may hand out the id anew
    int m_exitCode = -1;
};

} // namespace peru::posix
