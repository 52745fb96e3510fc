#include "peru/threads/posix/SignalImpl.h"

#include "peru/Errors.h"
#include "peru/posix/PlatformFile.h"
#include "peru/strings/IStringLocalizer.h"

#include <cerrno>
#include <ctime>

namespace peru::posix {

namespace {

class CScopedLock {
public:
    explicit CScopedLock(pthread_mutex_t& mutex) : m_mutex(mutex) { pthread_mutex_lock(&m_mutex); }
    ~CScopedLock() { pthread_mutex_unlock(&m_mutex); }
    CScopedLock(const CScopedLock&) = delete;
    CScopedLock& operator=(const CScopedLock&) = delete;

private:
    pthread_mutex_t& m_mutex;
};

timespec getDeadline(uint32_t milliseconds) {
    constexpr int64_t kSecond = 1'000'000'000;
    timespec now;
    clock_gettime(CLOCK_MONOTONIC, &now);
    const int64_t end = now.tv_sec * kSecond + now.tv_nsec + milliseconds * (kSecond / 1000);
    return {static_cast<time_t>(end / kSecond), static_cast<long>(end % kSecond)};
}

} // namespace

CSignalImpl::CSignalImpl() {
    pthread_condattr_t attributes;
    int error = pthread_condattr_init(&attributes);
    if (error == 0) {
        error = pthread_condattr_setclock(&attributes, CLOCK_MONOTONIC);
        if (error == 0) error = pthread_cond_init(&m_condition, &attributes);
        pthread_condattr_destroy(&attributes);
    }
    if (error == 0) {
        error = pthread_mutex_init(&m_mutex, nullptr);
        if (error != 0) pthread_cond_destroy(&m_condition);
    }
    if (error != 0)
        throw CError(localize("peru.CSignalImpl.createError", "Error creating event (%ERRORDESC%).",
                              {{"%ERRORDESC%", getSystemText(error)}}));
}

CSignalImpl::~CSignalImpl() {
    pthread_cond_destroy(&m_condition);
    pthread_mutex_destroy(&m_mutex);
}

void CSignalImpl::set() {
    CScopedLock lock(m_mutex);
    m_isSet = true;
    ++m_timesSet;
    pthread_cond_broadcast(&m_condition);
}

void CSignalImpl::reset() {
    CScopedLock lock(m_mutex);
    m_isSet = false;
}

bool CSignalImpl::wait(uint32_t milliseconds) {
    CScopedLock lock(m_mutex);
    if (m_isSet || milliseconds == 0) return m_isSet;
    const timespec deadline = getDeadline(milliseconds);
    const uint64_t before = m_timesSet;
    while (m_timesSet == before && pthread_cond_timedwait(&m_condition, &m_mutex, &deadline) == 0) {
    }
    return m_timesSet != before;
}

void CSignalImpl::wait() {
    CScopedLock lock(m_mutex);
    const uint64_t before = m_timesSet;
    while (!m_isSet && m_timesSet == before) pthread_cond_wait(&m_condition, &m_mutex);
}

} // namespace peru::posix
