// The lock that processes share by name.
#pragma once

#include "peru/Object.h"
#include "peru/strings/String.h"
#include "peru/threads/IMutex.h"

#include <memory>

namespace peru::posix {

class CMutexSegment;

// Lives in a small file that only the user may open, in $XDG_RUNTIME_DIR or, where that is not set, in
// /dev/shm. The file stays when the last process has gone. When an owner dies the next one gets the lock
// without an error.
class CGlobalMutexImpl : public CObject, public IMutex {
public:
    // Any text is a name. Throws CException.
    explicit CGlobalMutexImpl(const P<IString>& name);
    ~CGlobalMutexImpl() override;

    void lock() override; // throws CException
    void unlock() override;
    bool tryLock() override; // throws CException

private:
    [[noreturn]] void throwLockError() const;

    P<IString> m_name;
    std::shared_ptr<CMutexSegment> m_segment;
};

} // namespace peru::posix
