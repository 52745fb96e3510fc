// Opens value stores by URI.
#pragma once

#include "peru/settings/IValueStore.h"
#include "peru/uri/IURI.h"

namespace peru {

enum class EStoreAccess { read, readWrite };

class PERU_API IValueStoreFactory : public virtual IBase {
public:
    // Returns an empty handle for a URI of another kind, and an empty store if nothing exists at the URI yet.
    // Throws if existing content cannot be read.
    virtual P<IValueStore> openStore(const P<IURI>& uri, EStoreAccess access) = 0;
};

// Asks its factories in order of registration; returns an empty handle if none supports the URI. Thread-safe:
// one mutex is held while the factories are called.
class PERU_API IValueStoreManager : public virtual IValueStoreFactory {
public:
    virtual void addFactory(const P<IValueStoreFactory>& factory) = 0;
    virtual void removeFactory(const P<IValueStoreFactory>& factory) = 0;
};

// Supports "*.xml" files and "registry:" URIs from the start.
PERU_API P<IValueStoreManager> getValueStoreManager();

} // namespace peru
