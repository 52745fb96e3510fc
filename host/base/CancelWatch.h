// Reacts to Ctrl-C while a call of the library waits.
#pragma once

#include "base/Cancel.h"

#include <chrono>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <thread>

namespace host {

// Calls the function once, on a thread of its own, as soon as Ctrl-C was pressed. A signal handler could not
// do that, since the function may take locks.
class CCancelWatch {
public:
    explicit CCancelWatch(std::function<void()> react)
        : m_react(std::move(react)), m_thread([this] { run(); }) {}
    ~CCancelWatch() {
        {
            std::lock_guard lock(m_mutex);
            m_isOver = true;
        }
        m_changed.notify_one();
        m_thread.join();
    }
    CCancelWatch(const CCancelWatch&) = delete;
    CCancelWatch& operator=(const CCancelWatch&) = delete;

private:
    void run() {
        std::unique_lock lock(m_mutex);
        while (!m_isOver && !isCancelled()) m_changed.wait_for(lock, std::chrono::milliseconds(50));
        if (!m_isOver) m_react();
    }

    const std::function<void()> m_react;
    std::mutex m_mutex; // guards the next member
    bool m_isOver = false;
    std::condition_variable m_changed;
    std::thread m_thread; // last: it uses the others
};

} // namespace host
