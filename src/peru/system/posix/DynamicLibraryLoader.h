// Loads shared libraries.
#pragma once

#include "peru/Object.h"
#include "peru/system/IDynamicLibrary.h"

namespace peru::posix {

// Binds all symbols at once, so that a missing one is reported here and not in the middle of a job. The
// library's symbols are not visible to other libraries.
class CDynamicLibraryLoader : public CObject, public IDynamicLibraryLoader {
public:
    P<IDynamicLibrary> load(const P<IURI>& file) override;
    P<IDynamicLibrary> loadByName(const CStringArg& name) override;
};

} // namespace peru::posix
