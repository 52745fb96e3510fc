// The language of the program's texts.
#pragma once

#include "zvr_lang_manager/LanguagePack.h"

namespace zvr_lang {

class ZVR_LANG_API ILanguageManagerListener : public virtual peru::IBase {
public:
    // Called on the thread that has changed the language, after the texts have been replaced.
    virtual void languageChanged(const SLanguageId& id) = 0;
};

// A singleton. It is not thread-safe: use it on one thread, or with a lock. Other threads may look up texts
// while the language changes; they get the old, the default or the new text.
class ZVR_LANG_API CLanguageManager : public peru::CObject {
public:
    CLanguageManager();

    // Packs that are added later take precedence. Does not load any texts. Throws peru::CFileError if the
    // folder is none or cannot be read.
    void addPack(const peru::P<peru::IURI>& folder, const peru::P<peru::IString>& baseName,
                 const peru::P<peru::IString>& filePrefix);
    const std::vector<peru::P<CLanguagePack>>& getPacks() const { return m_packs; }

    // The language of the locale for messages (LC_ALL, LC_MESSAGES, LANG), such as "de_AT.UTF-8@euro". A
    // locale without a country gets that of the first pack file in the language. Invalid if there is no
    // such language, as for "C".
    SLanguageId getSystemLanguage() const;
    // The name of that locale; empty if none is set.
    static std::string getMessageLocale();
    // The language of a locale by its name, without the log lines.
    SLanguageId findLocale(std::string name) const;

    // Replaces all texts of the string localizer. Texts that no pack has stay at their English defaults. A
    // file or a listener that fails is logged.
    void setCurrentLanguage(const SLanguageId& id);
    const SLanguageId& getCurrentLanguage() const { return m_currentLanguage; }

    // Called in the order of adding.
    void addListener(const peru::P<ILanguageManagerListener>& listener);
    void removeListener(const peru::P<ILanguageManagerListener>& listener);

protected:
    ~CLanguageManager() override;

private:
    SLanguageId findByLanguage(const peru::P<peru::IString>& language) const;

    std::vector<peru::P<CLanguagePack>> m_packs;
    SLanguageId m_currentLanguage;
    std::vector<peru::P<ILanguageManagerListener>> m_listeners;
};

ZVR_LANG_API peru::P<CLanguageManager> getLanguageManager();

} // namespace zvr_lang
