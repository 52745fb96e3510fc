// Conversion between URIs and platform paths.
#pragma once

#include "peru/uri/IURI.h"

namespace peru {

class PERU_API IPathes : public virtual IBase {
public:
    // The bytes of the path as a terminated UTF-8 string; they need not be valid UTF-8. Empty unless the URI
    // is relative or a "file" URI of this host.
    virtual P<IString> toPlatformPath(const P<IURI>& uri, bool forDisplay = false) = 0;
    // Returns a relative URI for a relative path.
    virtual P<IURI> fromPlatformPath(const CStringArg& path) = 0;
    virtual P<IString> join(const CStringArg& folder, const CStringArg& fileName) = 0;
    // Folder (with its trailing separator) and file name.
    virtual void split(const CStringArg& path, P<IString>& folder, P<IString>& fileName) = 0;
    // $NAME and ${NAME}; throws CError with "error expanding environmental string".
    virtual P<IString> expandEnvironment(const CStringArg& text) = 0;
    virtual P<IString> unexpandEnvironment(const CStringArg& text) = 0;
};

PERU_API P<IPathes> getPathes();

// The text that messages show for a URI: its path for display, or the URI itself if it has no path.
PERU_API P<IString> getShownName(const P<IURI>& uri);

} // namespace peru
