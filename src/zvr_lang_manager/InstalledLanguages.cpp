#include "zvr_lang_manager/InstalledLanguages.h"

#include "peru/files/IFileSystemManager.h"
#include "peru/system/ISystem.h"
#include "peru/uri/IURI.h"
#include "zvr_lang_manager/LanguageLog.h"
#include "zvr_lang_manager/LanguageManager.h"

#include <algorithm>
#include <vector>

namespace zvr_lang {

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

P<CLanguageManager> getManagerWithPacks() {
    const P<CLanguageManager> manager = getLanguageManager();
    if (!manager->getPacks().empty()) return manager;
    const std::vector<P<peru::IURI>> folders = findFolders();
    for (auto folder = folders.rbegin(); folder != folders.rend(); ++folder) {
        try {
            for (const char* name : kPacks)
                manager->addPack(*folder, peru::newString(name), peru::newString(name) + "-");
        } catch (const std::exception& error) {
            logLoadError(*folder, error);
        }
    }
    return manager;
}

bool isEnglish(const std::string& name) {
    const std::string language = name.substr(0, name.find_first_of("_-.@"));
    return language.empty() || language == "C" || language == "POSIX" || language == "en" ||
           language == "eng";
}

} // namespace

void applyLanguage(const SLanguageId& id) {
    getManagerWithPacks()->setCurrentLanguage(id);
}

bool applyLocale(const std::string& name) {
    const P<CLanguageManager> known = getLanguageManager();
    if (isEnglish(name)) {
        // The files are not even listed if no other language has been set.
        if (known->getCurrentLanguage().valid)
            known->setCurrentLanguage(findLanguageId("en-US", ELanguageIdKind::languageAndCountry));
        return true;
    }
    const P<CLanguageManager> manager = getManagerWithPacks();
    const SLanguageId id = manager->findLocale(name);
    const auto translates = [&](const P<CLanguagePack>& pack) { return pack->findFile(id) != nullptr; };
    if (!id.valid || std::ranges::none_of(manager->getPacks(), translates)) return false;
    manager->setCurrentLanguage(id);
    return true;
}

} // namespace zvr_lang
