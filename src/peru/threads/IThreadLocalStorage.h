// Values that each thread has for itself.
#pragma once

#include "peru/P.h"

namespace peru {

// A bare word for each thread, null until it is set. Nobody looks after what it points to.
class PERU_API ISimpleThreadLocalStorage : public virtual IBase {
public:
    virtual void* get() const = 0;
    virtual void set(void* value) = 0; // throws CError
};

class PERU_API ISimpleThreadLocalStorageFactory : public virtual IBase {
public:
    virtual P<ISimpleThreadLocalStorage> createStorage() = 0; // throws CError when the system has no more
};

// A counted object for each thread. It is released when its thread ends, whoever made that thread, and when
// the slot dies.
class PERU_API IThreadLocalStorage : public virtual IBase {
public:
    virtual P<IBase> get() const = 0; // empty until it is set
    virtual void set(const P<IBase>& value) = 0;
};

PERU_API P<ISimpleThreadLocalStorageFactory> getSimpleThreadLocalStorageFactory();

} // namespace peru
