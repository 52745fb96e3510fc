// The interface cast: finds an interface on an object, on its delegate or among its aggregated objects.
#pragma once

#include "peru/P.h"

#include <typeindex>
#include <vector>

namespace peru {

// What an object says about where an interface of it is to be found. Both handles may be empty.
struct SInterfaceQueryResult {
    P<IBase> delegate;                // asked first, and followed recursively
    std::vector<P<IBase>> aggregated; // asked last, in order
};

// An object that stands for others answers this query; plain objects need not have it.
class PERU_API IInterfaceQuery : public virtual IBase {
public:
    virtual SInterfaceQueryResult queryInterface(const std::type_info& wanted) = 0;
};

namespace detail {
using InterfaceProbe = bool (*)(IBase*);
// The object in the delegate and aggregate graph of `object` for which the probe answers true, or null.
// Each object is visited once, so that a cycle ends.
PERU_API P<IBase> findInterface(IBase* object, const std::type_info& wanted, InterfaceProbe probe);
} // namespace detail

// Delegate first, then a run-time downcast, then the aggregated objects. Empty when none has it.
template <class T> P<T> interfaceCast(const P<IBase>& object) {
    if (!object) return nullptr;
    P<IBase> found = detail::findInterface(object.get(), typeid(T),
                                           [](IBase* o) { return dynamic_cast<T*>(o) != nullptr; });
    return tryCast<T>(found);
}

} // namespace peru
