// A mutex that shares the lifetime of the object that it guards.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"

namespace sonora2::common {

using peru::P;

// All facets of one plug-in object share one of these, so that every call into the object runs under one
// lock. It keeps the object alive; callers hold the lock while they use the object.
template <class T> class CEmbeddedMutex : public peru::CObject, public peru::IMutex {
public:
    explicit CEmbeddedMutex(const P<T>& object)
        : m_object(object), m_mutex(peru::getMutexFactory()->createMutex()) {}

    void lock() override { m_mutex->lock(); }
    void unlock() override { m_mutex->unlock(); }
    bool tryLock() override { return m_mutex->tryLock(); }

    const P<T>& getObject() const { return m_object; }

private:
    P<T> m_object;
    P<peru::IMutex> m_mutex;
};

} // namespace sonora2::common
