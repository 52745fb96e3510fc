// Smart pointers for objects returned by GIO. Does not include GIO's headers, so that users of a class with
// such a member do not need them.
#pragma once

#include "peru/Api.h"

#include <memory>

typedef struct _GError GError;
typedef struct _GFile GFile;
typedef struct _GFileEnumerator GFileEnumerator;
typedef struct _GFileInfo GFileInfo;

namespace peru::posix {

struct PERU_API SGObjectRelease {
    void operator()(void* object) const;
};
template <class T> using TGObject = std::unique_ptr<T, SGObjectRelease>;

struct PERU_API SGMemoryRelease {
    void operator()(void* memory) const;
};
using CGText = std::unique_ptr<char, SGMemoryRelease>;

struct PERU_API SGErrorRelease {
    void operator()(GError* error) const;
};
using CGError = std::unique_ptr<GError, SGErrorRelease>;

} // namespace peru::posix
