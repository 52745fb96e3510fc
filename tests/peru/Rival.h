// A second thread that competes for a lock.
#pragma once

#include <atomic>
#include <chrono>
#include <functional>
#include <thread>

namespace tests {

// Runs the operation on a thread of its own, which ends with this object at the latest.
class CRival {
public:
    explicit CRival(std::function<void()> operation)
        : m_thread([this, operation = std::move(operation)] {
              operation();
              m_done = true;
          }) {}
    ~CRival() { m_thread.join(); }
    CRival(const CRival&) = delete;
    CRival& operator=(const CRival&) = delete;

    // For a caller that holds the lock: true if the operation waits for it.
    bool isBlocked() const {
        std::this_thread::sleep_for(std::chrono::milliseconds(30));
        return !m_done;
    }

private:
    std::atomic<bool> m_done{false};
    std::thread m_thread;
};

} // namespace tests
