#include "peru/posix/Package.h"

#include "peru/IFileSystemManager.h"
#include "peru/IPathes.h"
#include "peru/IStreamManager.h"
#include "peru/ISystem.h"
#include "peru/IThreadManager.h"

namespace peru::posix {

CPackage::CPackage() : CPackageBase("peru::posix") {}

void CPackage::load(IPackageManager& manager) {
    getThreadManager();
    getPathes();
    getSystem();
    getStreamManager();
    getFileSystemManager();
}

} // namespace peru::posix
