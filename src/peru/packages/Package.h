// The packages of the foundation.
#pragma once

#include "peru/packages/IPackage.h"

namespace peru {

// Activates the required packages in their order, then calls load().
class PERU_API CPackageBase : public CObject, public IPackage {
public:
    CPackageBase(const CStringArg& name, const std::vector<const char*>& required = {});
    ~CPackageBase() override;

    P<IString> getName() override { return m_name; }
    // Throws CError when a required package is not known.
    void checkAndLoad(IPackageManager& manager) override;

protected:
    virtual void load(IPackageManager& manager) = 0;

private:
    P<IString> m_name;
    std::vector<P<IString>> m_required;
};

// "peru", the root: brings up every package that is registered.
class PERU_API CPackage : public CPackageBase {
public:
    CPackage();
    ~CPackage() override;

protected:
    void load(IPackageManager& manager) override;
};

} // namespace peru
