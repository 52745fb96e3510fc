// Growing arrays of values.
#pragma once

#include "peru/Api.h"

#include <algorithm>
#include <cstddef>
#include <memory>
#include <utility>

namespace peru {

// The part that does not depend on the element type. When count + 1 exceeds the capacity, the capacity
// becomes max(count + 1, capacity + step).
class PERU_API CSimpleArrayTemplateBase {
public:
    size_t getCount() const { return m_count; }
    size_t getCapacity() const { return m_capacity; }

protected:
    explicit CSimpleArrayTemplateBase(size_t step) : m_step(step) {}
    ~CSimpleArrayTemplateBase() = default;
    // The capacity needed for one more element.
    size_t getNextCapacity() const {
        return m_count < m_capacity ? m_capacity : std::max(m_count + 1, m_capacity + m_step);
    }

    size_t m_capacity = 0;
    size_t m_count = 0;

private:
    size_t m_step;
};

// Removing an element shifts the rest down and keeps the order. The elements are destroyed with the array.
template <class E> class TSimpleArray : public CSimpleArrayTemplateBase {
public:
    explicit TSimpleArray(size_t capacity = 0, size_t step = 16) : CSimpleArrayTemplateBase(step) {
        reserve(capacity);
    }
    TSimpleArray(const TSimpleArray&) = delete;
    TSimpleArray& operator=(const TSimpleArray&) = delete;
    ~TSimpleArray() {
        clear();
        std::allocator<E>().deallocate(m_elements, m_capacity);
    }

    void add(E element) {
        reserve(getNextCapacity());
        std::construct_at(m_elements + m_count, std::move(element));
        ++m_count;
    }
    // The element is destroyed last, when the array is consistent again: it may be a handle whose object
    // changes the array.
    void removeAt(size_t index) {
        E removed = std::move(m_elements[index]);
        std::move(m_elements + index + 1, m_elements + m_count, m_elements + index);
        std::destroy_at(m_elements + --m_count);
    }
    void clear() {
        while (m_count > 0) std::destroy_at(m_elements + --m_count);
    }

    E& operator[](size_t index) { return m_elements[index]; }
    const E& operator[](size_t index) const { return m_elements[index]; }
    E* begin() { return m_elements; }
    E* end() { return m_elements + m_count; }
    const E* begin() const { return m_elements; }
    const E* end() const { return m_elements + m_count; }

private:
    void reserve(size_t capacity) {
        if (capacity <= m_capacity) return;
        E* elements = std::allocator<E>().allocate(capacity);
        std::uninitialized_move_n(m_elements, m_count, elements);
        std::destroy_n(m_elements, m_count);
        std::allocator<E>().deallocate(m_elements, m_capacity);
        m_elements = elements;
        m_capacity = capacity;
    }

    E* m_elements = nullptr;
};

// A name for arrays of handles, which exist to release their elements.
template <class E> using TCleaningSimpleArray = TSimpleArray<E>;
using CCleaningSimpleArrayTemplateBase = CSimpleArrayTemplateBase;

} // namespace peru
