#include "zvr_lang_manager/LanguagePack.h"

#include "peru/files/IFileSystemManager.h"
#include "peru/strings/IStringLocalizer.h"
#include "zvr_lang_manager/LanguageLog.h"

#include <algorithm>

namespace zvr_lang {

using peru::IString;
using peru::P;

namespace {

constexpr const char* kExtension = ".zvrLang";

} // namespace

CLanguagePack::CLanguagePack(const P<peru::IURI>& folder, const P<IString>& baseName,
                             const P<IString>& filePrefix)
    : m_folder(folder), m_baseName(baseName), m_filePrefix(filePrefix) {}

CLanguagePack::~CLanguagePack() = default;

void CLanguagePack::loadFileList() {
    struct SFound {
        P<IString> name;
        P<peru::IURI> uri;
    };
    std::vector<SFound> found;
    const P<peru::IFileObjectCursor> cursor = peru::getFileSystemManager()->enumerate(m_folder);
    while (cursor->next()) {
        const P<peru::IFileObject> file = cursor->getFileObject();
        const P<IString> name = file->getName();
        if (!file->isFolder() && name->startsWith(m_filePrefix) && name->endsWith(kExtension))
            found.push_back({name, file->getURI()});
    }
    std::ranges::sort(found, [](const SFound& a, const SFound& b) { return a.name->isLess(b.name); });

    m_files.clear();
    for (const SFound& each : found) {
        try {
            m_files.push_back(CLanguageFile::open(each.uri));
        } catch (const std::exception& error) {
            logLoadError(each.uri, error);
        }
    }
}

P<CLanguageFile> CLanguagePack::findFile(const SLanguageId& id) const {
    P<CLanguageFile> other;
    for (const P<CLanguageFile>& file : m_files) {
        // The texts are unique: they are those of the tables.
        if (file->getLanguageId().languageName != id.languageName) continue;
        if (file->getLanguageId().countryCode == id.countryCode) return file;
        if (!other) other = file;
    }
    return other;
}

void CLanguagePack::loadLanguage(const SLanguageId& id) const {
    const P<CLanguageFile> file = findFile(id);
    if (!file) return;
    CLanguageEntries entries;
    file->load(entries, m_baseName);
    const P<peru::IStringLocalizer> localizer = peru::getStringLocalizer();
    entries.forEach([&](const SLanguageEntry& entry) {
        if (!(entry.flags & SLanguageEntry::kUnfinished)) localizer->setText(entry.key, entry.text);
    });
}

} // namespace zvr_lang
