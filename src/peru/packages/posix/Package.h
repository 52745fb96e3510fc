// The platform layer's package.
#pragma once

#include "peru/packages/Package.h"

namespace peru::posix {

// "peru::posix": creates the singletons that depend on the system, so that a machine on which one of them
// cannot be created reports it at start-up.
class CPackage : public CPackageBase {
public:
    CPackage();

protected:
    void load(IPackageManager& manager) override;
};

} // namespace peru::posix
