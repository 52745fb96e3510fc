#include "peru/packages/posix/Package.h"

#include "peru/files/IFileSystemManager.h"
#include "peru/streams/IStreamManager.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"
#include "peru/threads/IThreadManager.h"

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
