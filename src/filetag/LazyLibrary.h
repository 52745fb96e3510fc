// Loads the tag library, and TagLib with it, on first use: most processes never touch a tag. For modules that
// do not link it; the build defines FILETAG_SONAME for them.
#pragma once

#include "filetag/ILibrary.h"
#include "peru/Errors.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IDynamicLibrary.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"

#include <filesystem>

namespace filetag {

struct SLoadedLibrary {
    P<peru::IDynamicLibrary> module;
    P<ILibrary> library;
};

// From beside libperu. Throws CError if it is missing.
inline SLoadedLibrary loadLibrary() {
    for (const P<peru::IURI>& folder : peru::getSystem()->getSearchFolders("TONEWRIGHT_LIBRARY_PATH", "")) {
        const std::string path =
            peru::CString::toStdString(peru::getPathes()->toPlatformPath(folder)) + FILETAG_SONAME;
        std::error_code none;
        if (!std::filesystem::exists(path, none)) continue;
        SLoadedLibrary loaded;
        loaded.module =
            peru::getDynamicLibraryLoader()->load(peru::getPathes()->fromPlatformPath(path.c_str()));
        void* const entry = loaded.module->findSymbol(kGetLibraryName);
        if (!entry) throw peru::CError(peru::format("%s has no function %s", path.c_str(), kGetLibraryName));
        reinterpret_cast<GetLibraryFunction>(entry)(loaded.library);
        return loaded;
    }
    throw peru::CError(
        peru::format({"filetag.Library.missing", "The tag library %s is missing"}, FILETAG_SONAME));
}

// Throws CError if the library is missing. Any thread.
inline const P<ILibrary>& getLibrary() {
    // Never destroyed: objects and singletons of the library may live until the process ends, and so must its
    // code.
    static const SLoadedLibrary& s_loaded = *new SLoadedLibrary(loadLibrary());
    return s_loaded.library;
}

} // namespace filetag
