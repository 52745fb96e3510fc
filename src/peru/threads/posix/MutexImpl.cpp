#include "peru/threads/posix/MutexImpl.h"

namespace peru::posix {

// None of these calls can fail on this platform for a recursive mutex that is unlocked by its owner.

CMutexImpl::CMutexImpl() {
    pthread_mutexattr_t attributes;
    pthread_mutexattr_init(&attributes);
    pthread_mutexattr_settype(&attributes, PTHREAD_MUTEX_RECURSIVE);
    pthread_mutex_init(&m_mutex, &attributes);
    pthread_mutexattr_destroy(&attributes);
}

CMutexImpl::~CMutexImpl() {
    pthread_mutex_destroy(&m_mutex);
}

void CMutexImpl::lock() {
    pthread_mutex_lock(&m_mutex);
}

void CMutexImpl::unlock() {
    pthread_mutex_unlock(&m_mutex);
}

bool CMutexImpl::tryLock() {
    return pthread_mutex_trylock(&m_mutex) == 0;
}

} // namespace peru::posix
