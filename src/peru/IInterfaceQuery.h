// The interface cast: finds an interface on an object, on its delegate or among its aggregated objects.
#pragma once

#include "peru/P.h"

#include <typeindex>
#include <vector>

namespace peru {

// Where to search for an interface of an object. Both members may be empty.
struct SInterfaceQueryResult {
    P<IBase> delegate;                // searched first, recursively
    std::vector<P<IBase>> aggregated; // searched last, in order
};

// Implemented by objects that represent others; plain objects do not need it.
class PERU_API IInterfaceQuery : public virtual IBase {
public:
    virtual SInterfaceQueryResult queryInterface(const std::type_info& wanted) = 0;
};

namespace detail {
using InterfaceProbe = bool (*)(IBase*);
// Returns the first object in the delegate and aggregate graph of `object` for which the probe returns true,
// or null. Each object is visited once, so that cycles terminate.
PERU_API P<IBase> findInterface(IBase* object, const std::type_info& wanted, InterfaceProbe probe);
} // namespace detail

// Searches the delegate, then the object itself by a run-time downcast, then the aggregated objects. Returns
// an empty handle if none has the interface.
template <class T> P<T> interfaceCast(const P<IBase>& object) {
    if (!object) return nullptr;
    P<IBase> found = detail::findInterface(object.get(), typeid(T),
                                           [](IBase* o) { return dynamic_cast<T*>(o) != nullptr; });
    return tryCast<T>(found);
}

} // namespace peru
