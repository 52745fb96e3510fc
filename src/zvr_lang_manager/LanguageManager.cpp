#include "zvr_lang_manager/LanguageManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/log/ILog.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "zvr_lang_manager/LanguageLog.h"

#include <algorithm>
#include <cstdlib>

namespace zvr_lang {

using peru::CString;
using peru::IString;
using peru::P;

namespace {

// Locales have names here and no numbers. This is the number of a locale that has none of its own.
constexpr int kUnnumberedLocale = 0x1000;

void info(const P<IString>& text) {
    peru::getLogManager()->info(peru::newString(kLogComponent), text);
}

} // namespace

CLanguageManager::CLanguageManager() = default;
CLanguageManager::~CLanguageManager() = default;

P<CLanguageManager> getLanguageManager() {
    static const peru::CGlobalObjFactory::SKey key;
    return peru::CGlobalObjFactory::get<CLanguageManager>(key, [] { return peru::make<CLanguageManager>(); });
}

void CLanguageManager::addPack(const P<peru::IURI>& folder, const P<IString>& baseName,
                               const P<IString>& filePrefix) {
    const P<CLanguagePack> pack = peru::make<CLanguagePack>(folder, baseName, filePrefix);
    pack->loadFileList();
    m_packs.push_back(pack);
    info(peru::format("Added '%s' (files=%d)", baseName, static_cast<int>(pack->getFiles().size())));
}

SLanguageId CLanguageManager::findByLanguage(const P<IString>& language) const {
    for (const P<CLanguagePack>& pack : m_packs)
        for (const P<CLanguageFile>& file : pack->getFiles()) {
            const SLanguageId& id = file->getLanguageId();
            if (language->equalsIgnoreCase(id.shortCode) ||
                language->equalsIgnoreCase(id.getThreeLetterCode()))
                return id;
        }
    return {};
}

std::string CLanguageManager::getMessageLocale() {
    for (const char* name : {"LC_ALL", "LC_MESSAGES", "LANG"})
        if (const char* value = std::getenv(name); value && *value) return value;
    return {};
}

SLanguageId CLanguageManager::findLocale(std::string name) const {
    name.resize(std::min(name.find_first_of(".@"), name.size()));
    std::ranges::replace(name, '_', '-');
    const P<IString> text = CString::fromUTF8(name);
    SLanguageId id = findLanguageId(text, ELanguageIdKind::languageAndCountry);
    if (!id.valid && !name.empty()) id = findByLanguage(text);
    return id;
}

SLanguageId CLanguageManager::getSystemLanguage() const {
    info(peru::newString("getting system language ID"));
    info(peru::format("LCID: %d", kUnnumberedLocale));
    const SLanguageId id = findLocale(getMessageLocale());
    info(id.valid ? peru::format("System Language ID: %s", id.getText())
                  : peru::newString("could not detect systemm language"));
    return id;
}

void CLanguageManager::setCurrentLanguage(const SLanguageId& id) {
    const P<peru::ILogManager> log = peru::getLogManager();
    const P<IString> name = id.getText();
    log->trace(peru::newString("setCurrentLanguageID"), name);
    info(peru::format("Setting Language: %s", name));
    m_currentLanguage = id;
    peru::getStringLocalizer()->clear();
    for (const P<CLanguagePack>& pack : m_packs) {
        try {
            pack->loadLanguage(id);
        } catch (const std::exception& error) {
            logLoadError(pack->findFile(id)->getURI(), error);
        }
    }
    const std::vector<P<ILanguageManagerListener>> listeners = m_listeners; // may remove themselves
    for (const P<ILanguageManagerListener>& listener : listeners) {
        try {
            listener->languageChanged(id);
        } catch (const peru::CException& error) {
            log->logException(peru::newString(kLogComponent), error);
        }
    }
    log->trace(peru::newString("setCurrentLanguageID end"), name);
}

void CLanguageManager::addListener(const P<ILanguageManagerListener>& listener) {
    m_listeners.push_back(listener);
}

void CLanguageManager::removeListener(const P<ILanguageManagerListener>& listener) {
    std::erase(m_listeners, listener);
}

} // namespace zvr_lang
