#include "peru/system/IDesktop.h"

#include "InstallFolders.h"
#include "peru/GlobalObjFactory.h"
#include "peru/system/LazyLibrary.h"

namespace peru {

const P<IDesktop>& getDesktop() {
    static constexpr SLazyLibraryPlace kPlace{
        DESKTOP_SONAME,
        kGetDesktopName,
        TONEWRIGHT_PLUGIN_FOLDER,
        {"peru.Desktop.missing", "The library for the desktop, %s, is missing"}};
    return TLazyLibrary<IDesktop>::get(kPlace);
}

P<IFileTypesManager> getFileTypesManager() {
    static const CGlobalObjFactory::SKey key;
    // Loaded before the factory's lock is held: a thread that is just loading it needs that lock.
    getDesktop();
    return CGlobalObjFactory::get<IFileTypesManager>(key,
                                                     [] { return getDesktop()->createFileTypesManager(); });
}

} // namespace peru
