// Loads the CDDB library on first use: most processes never look up a disc. For modules that do not link it;
// the build defines FREEDB_SONAME and FREEDB_FOLDER for them.
#pragma once

#include "freedb/ILibrary.h"
#include "peru/Errors.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IDynamicLibrary.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"

#include <filesystem>

namespace freedb {

struct SLoadedLibrary {
    P<peru::IDynamicLibrary> module;
    P<ILibrary> library;
};

// From beside libperu or the folder of the plug-ins. Throws CError if it is missing.
inline SLoadedLibrary loadLibrary() {
    for (const P<peru::IURI>& folder :
         peru::getSystem()->getSearchFolders("TONEWRIGHT_LIBRARY_PATH", FREEDB_FOLDER)) {
        const std::string path =
            peru::CString::toStdString(peru::getPathes()->toPlatformPath(folder)) + FREEDB_SONAME;
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
    throw peru::CError("The CDDB library " FREEDB_SONAME " is missing");
}

// Throws CError if the library is missing. Any thread.
inline const P<ILibrary>& getLibrary() {
    // Never destroyed: objects and singletons of the library may live until the process ends, and so must its
    // code.
    static const SLoadedLibrary& s_loaded = *new SLoadedLibrary(loadLibrary());
    return s_loaded.library;
}

} // namespace freedb
