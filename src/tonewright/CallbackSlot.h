// A function that any thread may exchange while others call it.
#pragma once

#include <functional>
#include <memory>
#include <mutex>

namespace tonewright {

template <class Signature> class TCallbackSlot {
public:
    using Function = std::function<Signature>;

    void set(Function function) {
        auto next = function ? std::make_shared<const Function>(std::move(function)) : nullptr;
        std::scoped_lock lock(m_mutex);
        m_function.swap(next); // the old one is released outside the lock
    }
    // Null if there is none. Stays valid for the caller after an exchange.
    std::shared_ptr<const Function> get() const {
        std::scoped_lock lock(m_mutex);
        return m_function;
    }

private:
    mutable std::mutex m_mutex; // guards the handle, never held during a call
    std::shared_ptr<const Function> m_function;
};

} // namespace tonewright
