// The language files of the build, with gettext as judge.
#include "LanguageSupport.h"
#include "support/Process.h"

#include <cstring>
#include <map>

namespace {

using namespace tests;

// The texts of a compiled gettext catalogue by context, which is the key.
std::map<std::string, std::string> readCatalogue(const std::string& bytes) {
    const auto number = [&](size_t position) {
        uint32_t value = 0;
        std::memcpy(&value, bytes.data() + position, sizeof value);
        return value;
    };
    std::map<std::string, std::string> texts;
    for (uint32_t i = 0; i < number(8); ++i) {
        const auto string = [&](uint32_t table) {
            return bytes.substr(number(table + i * 8 + 4), number(table + i * 8));
        };
        const std::string id = string(number(12));
        if (const size_t context = id.find('\4'); context != std::string::npos)
            texts[id.substr(0, context)] = string(number(16));
    }
    return texts;
}

} // namespace

using Translations = CLanguageTest;

TEST_F(Translations, AreReadFromTheLanguageFilesAsGettextReadsThem) {
    const std::filesystem::path made = LANGUAGE_FOLDER;
    if (!std::filesystem::exists(made)) GTEST_SKIP() << "the build has made no language files";
    for (const char* pack : {"common", "peru"})
        manager->addPack(toURI(made.string() + "/"), peru::newString(pack), peru::newString(pack) + "-");
    int languages = 0;
    for (const auto& each : std::filesystem::directory_iterator(TRANSLATIONS_FOLDER)) {
        if (each.path().extension() != ".po") continue;
        const std::string catalogue = folder / "texts.mo";
        if (run({"msgfmt", each.path(), "-o", catalogue}).exitCode == 127) GTEST_SKIP() << "no msgfmt";
        const auto texts = readCatalogue(readFile(catalogue));
        ASSERT_FALSE(texts.empty()) << each.path();
        ++languages;
        for (const auto& pack : manager->getPacks())
            for (const auto& file : pack->getFiles())
                if (text(peru::newString(file->getLanguageId().shortCode)) == each.path().stem())
                    manager->setCurrentLanguage(file->getLanguageId());
        for (const auto& [key, translation] : texts) EXPECT_EQ(get(key.c_str()), translation) << key;
    }
    EXPECT_GE(languages, 4);
}
