#include "sonora2/plugins/CompanionLibrary.h"

#include "InstallFolders.h"
#include "peru/Errors.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"

#include <filesystem>

namespace sonora2::common {

P<peru::IDynamicLibrary> loadCompanionLibrary(const char* name) {
    const std::string fileName = std::string(name) + ".so";
    const P<peru::IDynamicLibraryLoader> loader = peru::getDynamicLibraryLoader();
    for (const P<peru::IURI>& folder :
         peru::getSystem()->getSearchFolders("TONEWRIGHT_PLUGIN_PATH", TONEWRIGHT_PLUGIN_FOLDER)) {
        const P<peru::IURI> file = folder->appendPath(fileName.c_str());
        std::error_code none;
        if (std::filesystem::exists(peru::CString::toStdString(peru::getPathes()->toPlatformPath(file)),
                                    none))
            return loader->load(file);
    }
    return loader->loadByName(fileName.c_str());
}

void* requireSymbol(const P<peru::IDynamicLibrary>& library, const char* name) {
    void* const symbol = library->findSymbol(name);
    if (!symbol) throw peru::CError(peru::format("The library loaded on demand has no function %s", name));
    return symbol;
}

} // namespace sonora2::common
