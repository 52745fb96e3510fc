// The implementation of IPackageManager.
#pragma once

#include "peru/collections/FrailArray.h"
#include "peru/packages/IPackage.h"
#include "peru/threads/IMutex.h"

namespace peru {

class PERU_API CPackageManager : public CObject, public IPackageManager {
public:
    explicit CPackageManager(std::vector<P<IPackage>> known = {});
    ~CPackageManager() override;

    void registerPackage(const P<IPackage>& package) override;
    P<IPackage> findPackage(const CStringArg& name) override;
    std::vector<P<IPackage>> getPackages() override;
    void activate(const P<IPackage>& package) override;
    bool activateByName(const CStringArg& name) override;
    bool isActive(const P<IPackage>& package) override;
    void addListener(IPackageListener* listener) override;
    void removeListener(IPackageListener* listener) override;

private:
    using CPackages = std::vector<P<IPackage>>;
    static bool contains(const CPackages& packages, const P<IPackage>& package);

    void notify(const P<IPackage>& package, void (IPackageListener::*event)(const P<IPackage>&));

    P<IMutex> m_mutex; // guards everything below
    CPackages m_known;
    CPackages m_active;
    CPackages m_activating;
    P<TFrailArray<IPackageListener>> m_listeners;
};

} // namespace peru
