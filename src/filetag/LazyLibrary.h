// Loads the tag library, and TagLib with it, on first use: most processes never touch a tag. For modules that
// do not link it; the build defines FILETAG_SONAME for them.
#pragma once

#include "filetag/ILibrary.h"
#include "peru/system/LazyLibrary.h"

namespace filetag {

using LazyLibrary = peru::TLazyLibrary<ILibrary>;
using SLoadedLibrary = LazyLibrary::SLoaded;

inline constexpr peru::SLazyLibraryPlace kLibraryPlace{
    FILETAG_SONAME, kGetLibraryName, "", {"filetag.Library.missing", "The tag library %s is missing"}};

// Both throw CError if the library is missing; see TLazyLibrary.
inline SLoadedLibrary loadLibrary() {
    return LazyLibrary::load(kLibraryPlace);
}
inline const P<ILibrary>& getLibrary() {
    return LazyLibrary::get(kLibraryPlace);
}

} // namespace filetag
