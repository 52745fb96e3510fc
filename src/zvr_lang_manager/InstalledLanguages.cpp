#include "tonewright/Languages.h"

#include "peru/files/IFileSystemManager.h"
#include "peru/system/ISystem.h"
#include "peru/uri/IURI.h"
#include "tonewright/Quietly.h"
#include "zvr_lang_manager/LanguageManager.h"

#include <vector>

namespace tonewright {

using peru::P;

namespace {

constexpr const char* kFolderName = "Lang/";
constexpr const char* kInstalledFolder = TONEWRIGHT_LANGUAGE_FOLDER "/";

// The parts of the program, which are the base names of the packs.
constexpr const char* kPacks[] = {"common", "peru"};

std::vector<P<peru::IURI>> findFolders() {
    const P<peru::ISystem> system = peru::getSystem();
    std::vector<P<peru::IURI>> folders = system->getSearchFolders("TONEWRIGHT_LANG_PATH", kInstalledFolder);
    // The language files are not in the folder of the libraries itself, which may be large.
    const std::vector<P<peru::IURI>> own = system->getSearchFolders(nullptr, nullptr);
    for (P<peru::IURI>& folder : folders)
        if (!own.empty() && folder->getAsString()->equals(own.front()->getAsString()))
            folder = folder->appendPath(kFolderName);
    std::erase_if(
        folders, [](const P<peru::IURI>& folder) { return !peru::getFileSystemManager()->isFolder(folder); });
    return folders;
}

} // namespace

void applyLanguage(const zvr_lang::SLanguageId& id) {
    const P<zvr_lang::CLanguageManager> manager = zvr_lang::getLanguageManager();
    if (manager->getPacks().empty()) {
        const std::vector<P<peru::IURI>> folders = findFolders();
        for (auto folder = folders.rbegin(); folder != folders.rend(); ++folder)
            for (const char* name : kPacks)
                quietly("applyLanguage", [&] {
                    manager->addPack(*folder, peru::newString(name), peru::newString(name) + "-");
                });
    }
    manager->setCurrentLanguage(id);
}

} // namespace tonewright
