// The packages of the foundation.
#pragma once

#include "peru/packages/IPackage.h"

namespace peru {

// Activates the required packages in the given order, then calls load().
class PERU_API CPackageBase : public CObject, public IPackage {
public:
    CPackageBase(const CStringArg& name, const std::vector<const char*>& required = {});
    ~CPackageBase() override;

    P<IString> getName() override { return m_name; }
    // Throws CError if a required package is not registered.
    void checkAndLoad(IPackageManager& manager) override;

protected:
    virtual void load(IPackageManager& manager) = 0;

private:
    P<IString> m_name;
    std::vector<P<IString>> m_required;
};

// "peru", the root package: activates every registered package.
class PERU_API CPackage : public CPackageBase {
public:
    CPackage();
    ~CPackage() override;

protected:
    void load(IPackageManager& manager) override;
};

} // namespace peru
