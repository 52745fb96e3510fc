// Loads the cover editor's module, and the user interface toolkit with it, on first use: a host that only
// converts never maps either. For modules that do not link it; the build defines COVEREDITOR_FILE,
// COVEREDITOR_FOLDER and COVEREDITOR_VERSION for them.
#pragma once

#include "ced/ILibrary.h"
#include "peru/system/LazyLibrary.h"

namespace ced {

using LazyLibrary = peru::TLazyLibrary<ILibrary>;

inline constexpr peru::SLazyLibraryPlace kLibraryPlace{
    COVEREDITOR_FILE,
    kGetLibraryName,
    COVEREDITOR_FOLDER,
    {"ced.Library.missing", "The cover editor %s is missing"}};

// Throws CError if the module is missing or is of another version; see TLazyLibrary.
inline const P<ILibrary>& getLibrary() {
    const P<ILibrary>& library = LazyLibrary::get(kLibraryPlace);
    if (const P<peru::IString> version = library->getVersion(); !version->equals(COVEREDITOR_VERSION))
        throw peru::CError(peru::format(
            {"ced.Library.version", "The cover editor has version %s, but this library needs version %s"},
            version, COVEREDITOR_VERSION));
    return library;
}

} // namespace ced
