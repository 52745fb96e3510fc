// Opens stores of values by URI.
#pragma once

#include "peru/settings/IValueStore.h"
#include "peru/uri/IURI.h"

namespace peru {

enum class EStoreAccess { read, readWrite };

class PERU_API IValueStoreFactory : public virtual IBase {
public:
    // Empty for a URI of another kind. What does not exist yet is an empty store; what is there and cannot be
    // read throws.
    virtual P<IValueStore> openStore(const P<IURI>& uri, EStoreAccess access) = 0;
};

// Asks its factories in the order of registration; the result is empty when none knows the URI. Safe from any
// thread: one mutex is held while they are asked.
class PERU_API IValueStoreManager : public virtual IValueStoreFactory {
public:
    virtual void addFactory(const P<IValueStoreFactory>& factory) = 0;
    virtual void removeFactory(const P<IValueStoreFactory>& factory) = 0;
};

// Knows files "*.xml" and "registry:" from the start.
PERU_API P<IValueStoreManager> getValueStoreManager();

} // namespace peru
