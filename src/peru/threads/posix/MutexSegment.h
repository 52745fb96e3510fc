// The shared memory of one global mutex.
#pragma once

#include <atomic>
#include <memory>
#include <pthread.h>
#include <string>
#include <utility>

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
    // the owner's list still refers to it; the lock counts as abandoned when the owning thread ends. The file
    // then stays until its next user removes it.
    void countLock() { m_locks.fetch_add(1, std::memory_order_relaxed); }
    void countUnlock() { m_locks.fetch_sub(1, std::memory_order_relaxed); }
    void forgetLocks() { m_locks.store(0, std::memory_order_relaxed); } // those of an owner that died

private:
    struct SLayout;
    CMutexSegment(std::string path, SLayout* layout) : m_path(std::move(path)), m_layout(layout) {}
    static SLayout* map(const std::string& path);
    static bool prepare(SLayout& layout);

    const std::string m_path;
    SLayout* m_layout;
    std::atomic<int> m_locks{0};
};

} // namespace peru::posix
