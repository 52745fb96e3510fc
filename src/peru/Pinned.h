// Singletons that outlive their factory's shutdown.
#pragma once

#include "peru/GlobalObjFactory.h"

#include <atomic>
#include <new>
#include <thread>

namespace peru {

// A handle to a singleton, meant to be a constant-initialised static. After the first call no lock is taken.
// The handle is never destroyed, so that strings also work in the destructors of other statics.
//
// A function-local static with an initialiser could deadlock: the initialising thread waits for the factory
// while it holds the static's guard, and a thread that creates another singleton holds the factory and waits
// for that guard.
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
        // The other thread only has to store a pointer.
        while (m_state.load(std::memory_order_acquire) != EState::pinned) std::this_thread::yield();
    }

    std::atomic<EState> m_state{EState::empty};
    alignas(P<T>) unsigned char m_storage[sizeof(P<T>)] = {};
};

} // namespace peru
