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
    // Activates what the package requires and sets it up. Throws when it cannot; the package then stays
    // inactive and may be tried again.
    virtual void checkAndLoad(IPackageManager& manager) = 0;
};

// Called with the manager's mutex held, on the thread that activates.
class PERU_API IPackageListener : public virtual IBase {
public:
    virtual void packageRegistered(const P<IPackage>& package) = 0;
    virtual void packageActivated(const P<IPackage>& package) = 0;
};

// Safe from any thread. The mutex is re-entrant and held while a package loads, so that who asks for a
// package on a second thread finds it active.
class PERU_API IPackageManager : public virtual IBase {
public:
    // A second package of a name that is known is not entered.
    virtual void registerPackage(const P<IPackage>& package) = 0;
    virtual P<IPackage> findPackage(const CStringArg& name) = 0; // empty when it is not known
    virtual std::vector<P<IPackage>> getPackages() = 0;          // in the order of registration
    // Does nothing for a package that is active or on the way: that is what ends a cycle.
    virtual void activate(const P<IPackage>& package) = 0;
    virtual bool activateByName(const CStringArg& name) = 0; // false for an unknown name
    virtual bool isActive(const P<IPackage>& package) = 0;
    virtual void addListener(IPackageListener* listener) = 0; // held without a reference
    virtual void removeListener(IPackageListener* listener) = 0;
};

// Knows "peru" and "peru::posix" from the start.
PERU_API P<IPackageManager> getPackageManager();

} // namespace peru
