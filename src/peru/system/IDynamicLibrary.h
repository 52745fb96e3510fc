// Shared libraries and processes, loaded and started at run time.
#pragma once

#include "peru/threads/IThreadManager.h"
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
    // Ends the process at once, whatever it does. It is reaped as usual.
    virtual void kill() = 0;
    // Runs the action on a thread of its own once the process has ended, at once if it already has. Replaces
    // an earlier action; empty removes it, but a call may be in progress.
    virtual void setEndAction(const P<IAction>& action) = 0;
};

class PERU_API IProcessManager : public virtual IBase {
public:
    // Starts at normal priority, or at `niceValue` if the user may do that, and inherits only the three
    // standard files. Throws CError on failure.
    virtual P<IProcess> start(const P<IURI>& executable, const std::vector<P<IString>>& arguments,
                              int niceValue = 0) = 0;
    virtual int64_t getCurrentProcessId() const = 0;
};

PERU_API P<IDynamicLibraryLoader> getDynamicLibraryLoader();
PERU_API P<IProcessManager> getProcessManager();

} // namespace peru
