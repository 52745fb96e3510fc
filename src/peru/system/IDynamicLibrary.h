// Shared libraries and processes, loaded and started at run time.
#pragma once

#include "peru/uri/IURI.h"

#include <vector>

namespace peru {

// Unloaded when the last reference is released.
class PERU_API IDynamicLibrary : public virtual IBase {
public:
    virtual void* findSymbol(const char* name) = 0; // null if not found
};

class PERU_API IDynamicLibraryLoader : public virtual IBase {
public:
    // Both throw CError with the loader's reason.
    virtual P<IDynamicLibrary> load(const P<IURI>& file) = 0;
    virtual P<IDynamicLibrary> loadByName(const CStringArg& name) = 0; // uses the platform's search path
};

class PERU_API IProcess : public virtual IBase {
public:
    virtual int64_t getId() const = 0;
    virtual bool wait(uint32_t milliseconds, int& exitCode) = 0; // false if it is still running
    virtual void terminate() = 0;
};

class PERU_API IProcessManager : public virtual IBase {
public:
    // Starts at normal priority and inherits only the three standard files. Throws CError on failure.
    virtual P<IProcess> start(const P<IURI>& executable, const std::vector<P<IString>>& arguments) = 0;
    virtual int64_t getCurrentProcessId() const = 0;
};

PERU_API P<IDynamicLibraryLoader> getDynamicLibraryLoader();
PERU_API P<IProcessManager> getProcessManager();

} // namespace peru
