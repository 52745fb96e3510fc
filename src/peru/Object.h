// CReferencable and CObject: the count that concrete classes inherit.
#pragma once

#include "peru/P.h"

#include <atomic>
#include <cstdint>

namespace peru {

// Holds the reference count. A new object starts at 1: that count belongs to whoever called new.
class PERU_API CReferencable {
protected:
    // Written before the object is destroyed, so that a stray addRef and release pair during
    // destruction cannot reach zero a second time.
    static constexpr int32_t kPoison = -1000000;

    CReferencable() noexcept = default;
    // Exceptions are copied while they propagate; the copy takes over the count unchanged.
    CReferencable(const CReferencable& other) noexcept
        : m_count(other.m_count.load(std::memory_order_relaxed)) {}
    CReferencable& operator=(const CReferencable&) noexcept { return *this; }
    // For a heap copy, which starts with a count of its own.
    void resetCount() noexcept { m_count.store(1, std::memory_order_relaxed); }
    // In debug builds asserts that the object was destroyed by its last release or was never shared.
    ~CReferencable();

    void increment() const noexcept { m_count.fetch_add(1, std::memory_order_relaxed); }
    // Returns true if this was the last reference; the count is then poisoned.
    bool decrement() const noexcept {
        if (m_count.fetch_sub(1, std::memory_order_acq_rel) != 1) return false;
        m_count.store(kPoison, std::memory_order_relaxed);
        return true;
    }

private:
    mutable std::atomic<int32_t> m_count{1};
};

// Implements IBase. Concrete classes derive from CObject and from one or more interfaces.
class PERU_API CObject : public CReferencable, public virtual IBase {
protected:
    CObject() noexcept = default;
    CObject(const CObject&) noexcept = default;
    CObject& operator=(const CObject&) noexcept = default;
    ~CObject() override;

public:
    void addRef() const override;
    void release() const override;
    void destroy() override;
    P<IString> getObjectDesc() const override;
};

} // namespace peru
