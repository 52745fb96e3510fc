#include "peru/system/IPathes.h"

namespace peru {

P<IString> getShownName(const P<IURI>& uri) {
    if (!uri) return CString::empty();
    P<IString> path = getPathes()->toPlatformPath(uri, true);
    return path->getDataSize() > 0 ? path : uri->getAsString();
}

} // namespace peru
