// The path grammar of Windows, as text: drive and UNC paths, and the long form.
#pragma once

#include "peru/uri/IURI.h"

namespace peru {

// From this many UTF-16 units upwards a path takes the long form. It stays some way under the platform's
// MAX_PATH, so that a file name may still be joined.
inline constexpr size_t kWindowsPathLimit = 240;

// Empty for an empty URI and for every scheme but "file". Throws CError when the path reaches the limit and
// the platform does not know the long form, or the path is neither a drive's nor a UNC path.
PERU_API P<IString> toWindowsPath(const P<IURI>& uri, bool knowsLongForm);

// Takes both forms. A path without drive and host gives a relative URI.
PERU_API P<IURI> fromWindowsPath(const CStringArg& path);

} // namespace peru
