// Singletons that outlive their factory's shutdown.
#pragma once

#include "peru/GlobalObjFactory.h"

#include <atomic>
#include <new>
#include <thread>

namespace peru {

// A handle on a singleton, to be a static with constant initialisation: after the first call no lock is
// taken, and the handle is never destroyed, so that strings work in the destructors of other statics too.
//
// It is no function-static that its constructor fills: the thread that constructs one would wait for the
// factory with the static's guard held, and a thread that makes another singleton with the factory held
// would wait for that guard.
template <class T> class TPinned {
public:
    constexpr TPinned() noexcept = default;

    const P<T>& get(const CGlobalObjFactory::SKey& key, P<T> (*create)()) {
        if (m_state.load(std::memory_order_acquire) != EState::pinned)
            pin(CGlobalObjFactory::get<T>(key, create));
        return *std::launder(reinterpret_cast<const P<T>*>(m_storage));
    }

private:
    enum class EState { empty, pinning, pinned };

    void pin(P<T> object) {
        EState expected = EState::empty;
        if (m_state.compare_exchange_strong(expected, EState::pinning, std::memory_order_acquire)) {
            ::new (m_storage) P<T>(std::move(object));
            m_state.store(EState::pinned, std::memory_order_release);
        }
        // Another thread has a pointer to store, nothing more.
        while (m_state.load(std::memory_order_acquire) != EState::pinned) std::this_thread::yield();
    }

    std::atomic<EState> m_state{EState::empty};
    alignas(P<T>) unsigned char m_storage[sizeof(P<T>)] = {};
};

} // namespace peru
