// Values that each thread has its own copy of.
#pragma once

#include "peru/P.h"

namespace peru {

// One pointer per thread, null until it is set. The pointed-to object is not owned.
class PERU_API ISimpleThreadLocalStorage : public virtual IBase {
public:
    virtual void* get() const = 0;
    virtual void set(void* value) = 0; // throws CError
};

class PERU_API ISimpleThreadLocalStorageFactory : public virtual IBase {
public:
    virtual P<ISimpleThreadLocalStorage>
    createStorage() = 0; // throws CError when the system's slots are exhausted
};

// One counted object per thread. It is released when the thread ends, even if this library did not create the
// thread, and when the slot is destroyed.
class PERU_API IThreadLocalStorage : public virtual IBase {
public:
    virtual P<IBase> get() const = 0; // empty until it is set
    virtual void set(const P<IBase>& value) = 0;
};

PERU_API P<ISimpleThreadLocalStorageFactory> getSimpleThreadLocalStorageFactory();

} // namespace peru
