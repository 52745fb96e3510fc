// Locks.
#pragma once

#include "peru/P.h"

namespace peru {

// Recursive: a thread that locks twice must unlock twice.
class PERU_API IMutex : public virtual IBase {
public:
    virtual void lock() = 0;
    virtual void unlock() = 0;
    virtual bool tryLock() = 0;
};

class PERU_API IMutexFactory : public virtual IBase {
public:
    virtual P<IMutex> createMutex() = 0;
    // Shared by all processes of the user that use the same name. Throws CException.
    virtual P<IMutex> createGlobalMutex(const P<IString>& name) = 0;
};

// Holds a mutex for a block. Code never calls unlock by hand.
class CMutexLock {
public:
    explicit CMutexLock(const P<IMutex>& mutex) : m_mutex(mutex) { m_mutex->lock(); }
    ~CMutexLock() { m_mutex->unlock(); }
    CMutexLock(const CMutexLock&) = delete;
    CMutexLock& operator=(const CMutexLock&) = delete;

private:
    P<IMutex> m_mutex;
};

PERU_API P<IMutexFactory> getMutexFactory();

} // namespace peru
