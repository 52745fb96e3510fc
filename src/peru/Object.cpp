#include "peru/Object.h"

#include "peru/ClassName.h"
#include "peru/strings/String.h"

#include <cassert>

namespace peru {

CReferencable::~CReferencable() {
    assert(m_count.load(std::memory_order_relaxed) == kPoison ||
           m_count.load(std::memory_order_relaxed) == 1);
}

CObject::~CObject() = default;

void CObject::addRef() const {
    increment();
}

void CObject::release() const {
    // The last reference destroys the object even if it was a reference to const.
    if (decrement()) const_cast<CObject*>(this)->destroy();
}

void CObject::destroy() {
    delete this;
}

P<IString> CObject::getObjectDesc() const {
    return newString(getClassName(typeid(*this)).c_str()) + " object";
}

} // namespace peru
