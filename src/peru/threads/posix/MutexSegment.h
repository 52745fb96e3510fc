// The shared memory of one global mutex.
#pragma once

#include <atomic>
#include <memory>
#include <pthread.h>
#include <string>

namespace peru::posix {

// Mapped once per process, however many handles exist: the C library links a locked mutex by its address into
// a list of its owner, so one mutex must not appear at two addresses.
class CMutexSegment {
public:
    // Empty if the segment cannot be opened or does not belong to the user.
    static std::shared_ptr<CMutexSegment> open(const std::string& name);
    ~CMutexSegment();
    CMutexSegment(const CMutexSegment&) = delete;
    CMutexSegment& operator=(const CMutexSegment&) = delete;

    pthread_mutex_t* getMutex() const;
    // If the segment object is destroyed while this process holds the mutex, the memory stays mapped because
    // the owner's list still refers to it; the lock counts as abandoned when the owning thread ends.
    void countLock() { m_locks.fetch_add(1, std::memory_order_relaxed); }
    void countUnlock() { m_locks.fetch_sub(1, std::memory_order_relaxed); }

private:
    struct SLayout;
    explicit CMutexSegment(SLayout* layout) : m_layout(layout) {}
    static SLayout* map(const std::string& path);
    static bool prepare(SLayout& layout);

    SLayout* m_layout;
    std::atomic<int> m_locks{0};
};

} // namespace peru::posix
