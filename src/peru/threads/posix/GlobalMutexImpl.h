// A named lock that is shared between processes.
#pragma once

#include "peru/Object.h"
#include "peru/strings/String.h"
#include "peru/threads/IMutex.h"

#include <memory>

namespace peru::posix {

class CMutexSegment;

// Stored in a small file in /dev/shm that only the user may open; the last process that uses it removes it.
// If an owner dies, the next one gets the lock without an error. Thread-safe.
class CGlobalMutexImpl : public CObject, public IMutex {
public:
    // Any text is a valid name. Throws CException.
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
