// The path grammar of Windows, as text: drive and UNC paths, and the long form.
#pragma once

#include "peru/uri/IURI.h"

namespace peru {

// Paths of this many UTF-16 units and more take the long form. The limit is below the platform's MAX_PATH, so
// that a file name can still be appended.
inline constexpr size_t kWindowsPathLimit = 240;

// Returns an empty text for an empty handle and for schemes other than "file". Throws CError if the path
// reaches the limit and the platform does not support the long form, or the path is neither a drive path nor
// a UNC path.
PERU_API P<IString> toWindowsPath(const P<IURI>& uri, bool knowsLongForm);

// Accepts both forms. A path without drive and host becomes a relative URI.
PERU_API P<IURI> fromWindowsPath(const CStringArg& path);

} // namespace peru
