// The language files of the build, with gettext as judge.
#include "LanguageSupport.h"
#include "support/Process.h"

#include <nlohmann/json.hpp>

#include <map>

namespace {

using namespace tests;

// Prints the texts of a compiled catalogue by context, which is the key.
constexpr const char* kRead =
    "import gettext, json, sys\n"
    "texts = gettext.GNUTranslations(open(sys.argv[1], 'rb'))._catalog.items()\n"
    "print(json.dumps({id.split('\\4')[0]: text for id, text in texts if '\\4' in id}))";

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
        const SProcessResult read = run({"python3", "-c", kRead, catalogue});
        const auto texts = nlohmann::json::parse(read.out).get<std::map<std::string, std::string>>();
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
