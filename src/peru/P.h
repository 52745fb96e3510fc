// Handles on counted objects: P<T>, PC<T> and PFrail<T>.
#pragma once

#include "peru/IBase.h"

#include <cstddef>
#include <type_traits>
#include <typeinfo>
#include <utility>

namespace peru {

// Throws CCastError; out of line, so that this header does not depend on the error tree.
[[noreturn]] PERU_API void throwCastError(const IBase* object, const std::type_info& target);

namespace detail {
template <class U, class T>
concept UpcastableTo = std::is_convertible_v<U*, T*>;
template <class U, class T>
concept UnrelatedTo = !std::is_convertible_v<U*, T*> && (std::is_const_v<T> || !std::is_const_v<U>);
} // namespace detail

// Strong handle, one word, may be empty. A copy costs one atomic increment, a move nothing.
//
// The constructor adopts a raw pointer: the initial reference from `new` passes to the handle. Use share()
// for an object that is already held elsewhere, such as `this`. Between unrelated interfaces the explicit
// conversion is a checked dynamic cast that throws CCastError; tryCast() returns an empty handle instead.
template <class T> class P {
public:
    using element_type = T;

    constexpr P() noexcept = default;
    constexpr P(std::nullptr_t) noexcept {}
    explicit P(T* adopted) noexcept : m_object(adopted) {}

    static P share(T* object) noexcept {
        if (object) object->addRef();
        return P(object);
    }

    P(const P& other) noexcept : m_object(other.m_object) {
        if (m_object) m_object->addRef();
    }
    P(P&& other) noexcept : m_object(std::exchange(other.m_object, nullptr)) {}

    template <detail::UpcastableTo<T> U> P(const P<U>& other) noexcept : m_object(other.get()) {
        if (m_object) m_object->addRef();
    }
    template <detail::UpcastableTo<T> U> P(P<U>&& other) noexcept : m_object(other.detach()) {}

    template <detail::UnrelatedTo<T> U> explicit P(const P<U>& other) {
        if (!other) return;
        m_object = dynamic_cast<T*>(other.get());
        if (!m_object) throwCastError(other.get(), typeid(T));
        m_object->addRef();
    }

    ~P() {
        if (m_object) m_object->release();
    }

    P& operator=(const P& other) noexcept {
        P(other).swap(*this);
        return *this;
    }
    P& operator=(P&& other) noexcept {
        P(std::move(other)).swap(*this);
        return *this;
    }
    P& operator=(std::nullptr_t) noexcept {
        reset();
        return *this;
    }

    void reset() noexcept { P().swap(*this); }
    void swap(P& other) noexcept { std::swap(m_object, other.m_object); }

    // Gives up the reference without releasing it.
    [[nodiscard]] T* detach() noexcept { return std::exchange(m_object, nullptr); }

    T* get() const noexcept { return m_object; }
    T* operator->() const noexcept { return m_object; }
    T& operator*() const noexcept { return *m_object; }
    explicit operator bool() const noexcept { return m_object != nullptr; }

    template <class U> bool operator==(const P<U>& other) const noexcept { return m_object == other.get(); }
    bool operator==(std::nullptr_t) const noexcept { return m_object == nullptr; }

private:
    T* m_object = nullptr;
};

// The same for a pointer to const, as returned by constant arrays and enumerators.
template <class T> class PC : public P<const T> {
public:
    using P<const T>::P;
    PC(const P<const T>& other) : P<const T>(other) {}
    PC(const P<T>& other) : P<const T>(other) {}
};

// Creates an object and a handle that adopts it.
template <class T, class... Args> P<T> make(Args&&... args) {
    return P<T>(new T(std::forward<Args>(args)...));
}

// A plain run-time cast; returns an empty handle if the object does not have the interface.
template <class T, class U> P<T> tryCast(const P<U>& object) noexcept {
    return P<T>::share(dynamic_cast<T*>(object.get()));
}

// A handle that holds a reference only when its flag is set. With the flag clear it does not keep the object
// alive: an object registered that way must be removed before it is destroyed.
template <class T> class PFrail {
public:
    PFrail() noexcept = default;
    PFrail(T* object, bool counted) noexcept : m_object(object), m_counted(counted) { acquire(); }
    PFrail(const PFrail& other) noexcept : m_object(other.m_object), m_counted(other.m_counted) { acquire(); }
    PFrail(PFrail&& other) noexcept
        : m_object(std::exchange(other.m_object, nullptr)), m_counted(other.m_counted) {}
    ~PFrail() {
        if (m_object && m_counted) m_object->release();
        m_object = nullptr;
    }
    PFrail& operator=(PFrail other) noexcept {
        std::swap(m_object, other.m_object);
        std::swap(m_counted, other.m_counted);
        return *this;
    }

    T* get() const noexcept { return m_object; }
    T* operator->() const noexcept { return m_object; }
    bool isCounted() const noexcept { return m_counted; }

    // Compares the pointer only, never the flag.
    bool operator==(const PFrail& other) const noexcept { return m_object == other.m_object; }
    bool operator==(const T* object) const noexcept { return m_object == object; }

private:
    void acquire() noexcept {
        if (m_object && m_counted) m_object->addRef();
    }

    T* m_object = nullptr;
    bool m_counted = false;
};

} // namespace peru
