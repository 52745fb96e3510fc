// Start-up units of the framework.
#pragma once

#include "peru/strings/String.h"

#include <vector>

namespace peru {

class IPackageManager;

// A layer that must be set up once before it is used, such as the platform's or the network's.
class PERU_API IPackage : public virtual IBase {
public:
    virtual P<IString> getName() = 0;
    // Activates the required packages, then initialises this one. If it throws, the package stays inactive
    // and activation may be retried.
    virtual void checkAndLoad(IPackageManager& manager) = 0;
};

// Called with the manager's mutex held, on the thread that registers or activates the package. A listener may
// call the manager, also to remove itself or others, but must not wait for another thread that calls it.
class PERU_API IPackageListener : public virtual IBase {
public:
    virtual void packageRegistered(const P<IPackage>& package) = 0;
    virtual void packageActivated(const P<IPackage>& package) = 0;
};

// Thread-safe. The recursive mutex is held while a package loads, so that a second thread that activates the
// same package waits until it is active. A package must not wait, while it loads, for another thread that
// calls the manager.
class PERU_API IPackageManager : public virtual IBase {
public:
    // Ignored if a package with this name is already registered.
    virtual void registerPackage(const P<IPackage>& package) = 0;
    virtual P<IPackage> findPackage(const CStringArg& name) = 0; // empty if not registered
    virtual std::vector<P<IPackage>> getPackages() = 0;          // in order of registration
    // Does nothing for a package that is active or being activated, which ends cycles.
    virtual void activate(const P<IPackage>& package) = 0;
    virtual bool activateByName(const CStringArg& name) = 0; // false for an unknown name
    virtual bool isActive(const P<IPackage>& package) = 0;
    virtual void addListener(IPackageListener* listener) = 0; // not owned
    virtual void removeListener(IPackageListener* listener) = 0;
};

// Contains "peru" and "peru::posix" from the start.
PERU_API P<IPackageManager> getPackageManager();

} // namespace peru
