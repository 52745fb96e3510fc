// The language files of one part of the program.
#pragma once

#include "zvr_lang_manager/LanguageFile.h"

#include <vector>

namespace zvr_lang {

class ZVR_LANG_API CLanguagePack : public peru::CObject {
public:
    // The files are the `folder`'s "*.zvrLang" whose names begin with the prefix. The base name selects
    // blocks within them.
    CLanguagePack(const peru::P<peru::IURI>& folder, const peru::P<peru::IString>& baseName,
                  const peru::P<peru::IString>& filePrefix);

    // Throws peru::CFileError if the folder is none or cannot be read. A file that cannot be read is logged
    // and left out.
    void loadFileList();
    // The file for the language and country; otherwise the first file in the order of names that is for the
    // language in another country, since Swiss users prefer the German of Germany to English. Empty if
    // there is none.
    peru::P<CLanguageFile> findFile(const SLanguageId& id) const;
    // Sets the texts of that language in the localizer, if there is a file. A damaged file sets none of its
    // texts and throws peru::CException.
    void loadLanguage(const SLanguageId& id) const;

    const peru::P<peru::IString>& getBaseName() const { return m_baseName; }
    const std::vector<peru::P<CLanguageFile>>& getFiles() const { return m_files; }

protected:
    ~CLanguagePack() override;

private:
    peru::P<peru::IURI> m_folder;
    peru::P<peru::IString> m_baseName;
    peru::P<peru::IString> m_filePrefix;
    std::vector<peru::P<CLanguageFile>> m_files;
};

} // namespace zvr_lang
