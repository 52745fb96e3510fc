#include "peru/posix/PlatformFile.h"

#include "peru/Errors.h"
#include "peru/system/IPathes.h"

#include <system_error>
#include <unistd.h>

namespace peru::posix {

bool CFileHandle::close() noexcept {
    int descriptor = std::exchange(m_descriptor, -1);
    // An interrupted close has still closed the descriptor.
    return descriptor < 0 || ::close(descriptor) == 0;
}

std::string tryToPath(const P<IURI>& uri) {
    std::string path = CString::toStdString(getPathes()->toPlatformPath(uri));
    while (path.size() > 1 && path.back() == '/') path.pop_back();
    return path;
}

std::string toPath(const P<IURI>& uri) {
    std::string path = tryToPath(uri);
    if (path.empty()) throw CURITypeNotSupportedError(uri);
    return path;
}

P<IURI> toURI(const std::string& path) {
    return getPathes()->fromPlatformPath(CString::fromUTF8(path));
}

P<IURI> toFolderURI(std::string path) {
    if (!path.ends_with('/')) path += '/';
    return toURI(path);
}

P<IString> getSystemText(int error) {
    return CString::fromUTF8(std::generic_category().message(error));
}

} // namespace peru::posix
