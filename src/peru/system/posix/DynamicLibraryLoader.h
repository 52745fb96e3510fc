// Loads shared libraries.
#pragma once

#include "peru/Object.h"
#include "peru/system/IDynamicLibrary.h"

namespace peru::posix {

// Symbols are bound at once, so that a library that lacks one fails here and not in the middle of a job, and
// stay the library's own.
class CDynamicLibraryLoader : public CObject, public IDynamicLibraryLoader {
public:
    P<IDynamicLibrary> load(const P<IURI>& file) override;
    P<IDynamicLibrary> loadByName(const CStringArg& name) override;
};

} // namespace peru::posix
