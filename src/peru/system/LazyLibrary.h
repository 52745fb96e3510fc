// Loads a library of the system on first use, for modules that do not link it.
#pragma once

#include "peru/Errors.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IDynamicLibrary.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"

#include <atomic>
#include <filesystem>

namespace peru {

struct SLazyLibraryPlace {
    const char* file;       // its name
    const char* function;   // returns the library's object in its only parameter, P<L>&
    const char* folder;     // searched in addition to that of libperu; may be empty
    SLocalizedText missing; // message if there is no such file, whose name is %s
};

// `L` is the interface of the library's object.
template <class L> class TLazyLibrary {
public:
    struct SLoaded {
        P<IDynamicLibrary> module;
        P<L> library;
    };

    // A load of the caller's own. Throws CError if the library is missing.
    static SLoaded load(const SLazyLibraryPlace& place) {
        for (const P<IURI>& folder : getSystem()->getSearchFolders("TONEWRIGHT_LIBRARY_PATH", place.folder)) {
            const std::string path = CString::toStdString(getPathes()->toPlatformPath(folder)) + place.file;
            std::error_code none;
            if (!std::filesystem::exists(path, none)) continue;
            SLoaded loaded;
            loaded.module = getDynamicLibraryLoader()->load(getPathes()->fromPlatformPath(path.c_str()));
            void* const entry = loaded.module->findSymbol(place.function);
            if (!entry) throw CError(format("%s has no function %s", path.c_str(), place.function));
            reinterpret_cast<void (*)(P<L>&)>(entry)(loaded.library);
            return loaded;
        }
        throw CError(format(place.missing, place.file));
    }

    // The one that lasts for the process, for each module that calls this. Throws CError if the library is
    // missing. Any thread.
    static const P<L>& get(const SLazyLibraryPlace& place) {
        // Never destroyed: objects and singletons of the library may live until the process ends, and so must
        // its code.
        static const SLoaded& s_loaded = *new SLoaded(load(place));
        s_isLoaded = true;
        return s_loaded.library;
    }
    // Whether this module has called get().
    static bool isLoaded() { return s_isLoaded; }

private:
    static inline std::atomic<bool> s_isLoaded{false};
};

} // namespace peru
