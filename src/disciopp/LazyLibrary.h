// Loads this library, and the disc access library with it, on first use: most processes never touch a disc.
// For modules that do not link it; the build defines DISCIOPP_SONAME for them.
#pragma once

#include "disciopp/ILibrary.h"
#include "peru/system/LazyLibrary.h"

namespace disciopp {

using LazyLibrary = peru::TLazyLibrary<ILibrary>;
using SLoadedLibrary = LazyLibrary::SLoaded;

inline constexpr peru::SLazyLibraryPlace kLibraryPlace{
    DISCIOPP_SONAME, kGetLibraryName, "", {"disciopp.Library.missing", "The disc library %s is missing"}};

// Both throw CError if the library is missing; see TLazyLibrary.
inline SLoadedLibrary loadLibrary() {
    return LazyLibrary::load(kLibraryPlace);
}
inline const P<ILibrary>& getLibrary() {
    return LazyLibrary::get(kLibraryPlace);
}

} // namespace disciopp
