// Threads that compete for a lock.
#pragma once

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <functional>
#include <list>
#include <thread>

namespace tests {

// The threads end with this object at the latest.
class CRivals {
public:
    ~CRivals() {
        for (SRival& rival : m_rivals) rival.thread.join();
    }

    // For a caller that holds the lock: runs each operation on a thread of its own and expects it to wait.
    void expectBlocked(std::initializer_list<std::function<void()>> operations) {
        for (const auto& operation : operations) {
            SRival& rival = m_rivals.emplace_back();
            rival.thread = std::thread([operation, &rival] {
                operation();
                rival.done = true;
            });
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        for (const SRival& rival : m_rivals) EXPECT_FALSE(rival.done);
    }

private:
    struct SRival {
        std::thread thread;
        std::atomic<bool> done{false};
    };
    std::list<SRival> m_rivals;
};

} // namespace tests
