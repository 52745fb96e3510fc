#include "peru/threads/posix/GlobalMutexImpl.h"

#include "peru/Exception.h"
#include "peru/threads/posix/MutexSegment.h"

#include <cerrno>
#include <pthread.h>

namespace peru::posix {

namespace {

// Takes over a mutex from an owner that died. If this process dies before the call, the mutex stays
// abandoned.
int recover(CMutexSegment& segment, int result) {
    if (result != EOWNERDEAD) return result;
    segment.forgetLocks();
    return pthread_mutex_consistent(segment.getMutex());
}

} // namespace

CGlobalMutexImpl::CGlobalMutexImpl(const P<IString>& name)
    : m_name(name), m_segment(CMutexSegment::open(CString::toStdString(name))) {
    if (!m_segment) throw CException("Error createing global mutex " + name, newString("Error"));
}

CGlobalMutexImpl::~CGlobalMutexImpl() = default;

void CGlobalMutexImpl::lock() {
    if (recover(*m_segment, pthread_mutex_lock(m_segment->getMutex())) != 0) throwLockError();
    m_segment->countLock();
}

void CGlobalMutexImpl::unlock() {
    if (pthread_mutex_unlock(m_segment->getMutex()) == 0) m_segment->countUnlock();
}

bool CGlobalMutexImpl::tryLock() {
    const int result = pthread_mutex_trylock(m_segment->getMutex());
    if (result == EBUSY) return false;
    if (recover(*m_segment, result) != 0) throwLockError();
    m_segment->countLock();
    return true;
}

void CGlobalMutexImpl::throwLockError() const {
    throw CException("Error locking global mutex " + m_name, newString("Error"));
}

} // namespace peru::posix
