// Enumerators, in place of iterators.
#pragma once

#include "peru/Object.h"

#include <cstdint>

namespace peru {

// getNext past the end throws CEndOfEnumError.
class PERU_API IConstEnum : public virtual IBase {
public:
    virtual bool hasMore() const = 0;
    virtual int32_t getCount() const = 0; // of the whole collection
    virtual PC<IBase> getNextConst() = 0;
    virtual void reset() = 0;
};

class PERU_API IEnum : public virtual IConstEnum {
public:
    virtual P<IBase> getNext() = 0;
};

// Throws CEndOfEnumError; out of line, so that this header does not depend on the error tree.
[[noreturn]] PERU_API void throwEndOfEnum();

// A typed view of an enumerator. Without one it has no elements.
template <class T> class WEnum {
public:
    WEnum() = default;
    WEnum(P<IEnum> elements) : m_elements(std::move(elements)) {}

    bool hasMore() const { return m_elements && m_elements->hasMore(); }
    int32_t getCount() const { return m_elements ? m_elements->getCount() : 0; }
    P<T> getNext() {
        if (!m_elements) throwEndOfEnum();
        return P<T>(m_elements->getNext());
    }
    void reset() {
        if (m_elements) m_elements->reset();
    }
    const P<IEnum>& getEnum() const { return m_elements; }

private:
    P<IEnum> m_elements;
};

} // namespace peru
