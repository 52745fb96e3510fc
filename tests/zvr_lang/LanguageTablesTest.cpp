// Compares the tables with the lists of the package iso-codes.
#include "zvr_lang_manager/LanguageId.h"

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <fstream>

using zvr_lang::ELanguageIdKind;
using zvr_lang::findLanguageId;

namespace {

nlohmann::json read(const std::string& standard) {
    std::ifstream file("/usr/share/iso-codes/json/iso_" + standard + ".json");
    return file ? nlohmann::json::parse(file)[standard] : nlohmann::json();
}

std::string text(const char16_t* entry) {
    return peru::CString::toStdString(entry);
}

} // namespace

TEST(LanguageTables, ResolveEveryCodeOfTheStandards) {
    const nlohmann::json languages = read("639-2");
    const nlohmann::json countries = read("3166-1");
    if (languages.empty() || countries.empty()) GTEST_SKIP() << "iso-codes is not installed";
    ASSERT_GE(languages.size(), 485u);
    ASSERT_GE(countries.size(), 247u);
    for (const auto& language : languages) {
        const std::string code = language["alpha_3"];
        if (code.size() != 3) continue; // a range for local use
        for (const std::string& spelling : {code, language.value("alpha_2", code)}) {
            const auto id = findLanguageId((spelling + "-AT").c_str(), ELanguageIdKind::languageAndCountry);
            ASSERT_TRUE(id.valid) << spelling;
            EXPECT_EQ(peru::CString::toStdString(id.getThreeLetterCode()), code);
            EXPECT_EQ(text(id.shortCode), language.value("alpha_2", ""));
            EXPECT_EQ(text(id.languageName), language["name"].get<std::string>());
            const std::string both = language.contains("bibliographic")
                                         ? language["bibliographic"].get<std::string>() + "/" + code
                                         : code;
            EXPECT_EQ(text(id.bibliographicCode), both);
        }
    }
    for (const auto& country : countries) {
        const std::string code = country["alpha_2"];
        const auto id = findLanguageId(code.c_str(), ELanguageIdKind::countryCode);
        ASSERT_TRUE(id.valid) << code;
        EXPECT_EQ(text(id.countryName), country.value("common_name", country["name"].get<std::string>()));
        EXPECT_TRUE(findLanguageId(("de-" + code).c_str(), ELanguageIdKind::languageAndCountry).valid);
    }
}
