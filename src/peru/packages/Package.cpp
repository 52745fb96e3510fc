#include "peru/packages/Package.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

namespace peru {

CPackageBase::CPackageBase(const CStringArg& name, const std::vector<const char*>& required)
    : m_name(CString::fromUTF8(CString::toStdString(name))) {
    for (const char* package : required) m_required.push_back(CString::fromUTF8(package));
}

CPackageBase::~CPackageBase() = default;

void CPackageBase::checkAndLoad(IPackageManager& manager) {
    for (const P<IString>& name : m_required) {
        if (manager.activateByName(name)) continue;
        throw CError(localize("peru.CPackageBase.RequiredPackageMissing",
                              "The package '%PACKAGE%' requires the unknown package '%REQUIRED%'.",
                              {{"%PACKAGE%", m_name}, {"%REQUIRED%", name}}));
    }
    load(manager);
}

CPackage::CPackage() : CPackageBase("peru") {}

CPackage::~CPackage() = default;

void CPackage::load(IPackageManager& manager) {
    for (const P<IPackage>& package : manager.getPackages()) manager.activate(package);
}

} // namespace peru
