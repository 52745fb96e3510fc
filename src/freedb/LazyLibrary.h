// Loads the CDDB library on first use: most processes never look up a disc. For modules that do not link it;
// the build defines FREEDB_SONAME and FREEDB_FOLDER for them.
#pragma once

#include "freedb/ILibrary.h"
#include "peru/system/LazyLibrary.h"

namespace freedb {

using LazyLibrary = peru::TLazyLibrary<ILibrary>;
using SLoadedLibrary = LazyLibrary::SLoaded;

inline constexpr peru::SLazyLibraryPlace kLibraryPlace{
    FREEDB_SONAME,
    kGetLibraryName,
    FREEDB_FOLDER,
    {"freedb.Library.missing", "The CDDB library %s is missing"}};

// Both throw CError if the library is missing; see TLazyLibrary.
inline SLoadedLibrary loadLibrary() {
    return LazyLibrary::load(kLibraryPlace);
}
inline const P<ILibrary>& getLibrary() {
    return LazyLibrary::get(kLibraryPlace);
}

} // namespace freedb
