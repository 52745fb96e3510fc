// Listener lists.
#pragma once

#include "peru/Object.h"
#include "peru/collections/SimpleArray.h"

namespace peru {

// A counted listener list. Ordinary listeners are registered without a reference and must be removed before
// they are destroyed. Not thread-safe: the owner documents which thread or lock guards it.
template <class T> class TFrailArray : public CObject {
public:
    // Without a reference: for classes that must not keep their listeners alive.
    void add(T* listener) { m_elements.add(PFrail<T>(listener, false)); }
    // With a reference, held until the listener is removed.
    void addCounted(const P<T>& listener) { m_elements.add(PFrail<T>(listener.get(), true)); }

    // Removes the first match and returns whether there was one; the others keep their order.
    bool remove(const T* listener) {
        for (size_t i = 0; i < m_elements.getCount(); ++i) {
            if (!(m_elements[i] == listener)) continue;
            m_elements.removeAt(i);
            return true;
        }
        return false;
    }
    bool contains(const T* listener) const {
        for (const PFrail<T>& element : m_elements)
            if (element == listener) return true;
        return false;
    }

    size_t getCount() const { return m_elements.getCount(); }
    // Returns null past the end, so that a loop by index survives a listener that removes itself.
    T* at(size_t index) const { return index < m_elements.getCount() ? m_elements[index].get() : nullptr; }

private:
    TCleaningSimpleArray<PFrail<T>> m_elements{0, 4};
};

} // namespace peru
