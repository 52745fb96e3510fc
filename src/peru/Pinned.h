// Singletons that outlive their factory's shutdown.
#pragma once

#include "peru/GlobalObjFactory.h"

#include <new>

namespace peru {

// A function-static handle on a singleton: after the first call no lock is taken, and the handle is never
// destroyed, so that strings work in the destructors of other statics too.
template <class T> class TPinned {
public:
    TPinned(const CGlobalObjFactory::SKey& key, P<T> (*create)()) {
        ::new (m_storage) P<T>(CGlobalObjFactory::get<T>(key, create));
    }
    const P<T>& get() const { return *std::launder(reinterpret_cast<const P<T>*>(m_storage)); }

private:
    alignas(P<T>) unsigned char m_storage[sizeof(P<T>)];
};

} // namespace peru
