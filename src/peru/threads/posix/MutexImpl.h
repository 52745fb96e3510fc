// The ordinary lock.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"

#include <pthread.h>

namespace peru::posix {

class CMutexImpl : public CObject, public IMutex {
public:
    CMutexImpl();
    ~CMutexImpl() override;
    CMutexImpl(const CMutexImpl&) = delete;
    CMutexImpl& operator=(const CMutexImpl&) = delete;

    void lock() override;
    void unlock() override;
    bool tryLock() override;

private:
    pthread_mutex_t m_mutex;
};

} // namespace peru::posix
