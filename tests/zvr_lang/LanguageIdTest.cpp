#include "zvr_lang_manager/LanguageId.h"

#include <gtest/gtest.h>

using zvr_lang::ELanguageIdKind;
using zvr_lang::findLanguageId;

namespace {

std::u16string text(const char16_t* entry) {
    return entry ? entry : u"(null)";
}

} // namespace

TEST(LanguageId, FindsLanguageWithCountryByEitherCode) {
    for (const char* spelling : {"de-AT", "DE-at", "deu-AT"}) {
        auto id = findLanguageId(spelling, ELanguageIdKind::languageAndCountry);
        ASSERT_TRUE(id.valid) << spelling;
        EXPECT_EQ(text(id.languageName), u"German");
        EXPECT_EQ(text(id.countryCode), u"AT");
        EXPECT_EQ(text(id.countryName), u"Austria");
    }
    // A language without a two-letter code can only be found by its three-letter code.
    EXPECT_EQ(text(findLanguageId(u"haw-US", ELanguageIdKind::languageAndCountry).shortCode), u"");
}

TEST(LanguageId, ClearsTheWholeRecordWhenOnePartDoesNotFit) {
    for (const char* spelling :
         {"", "de", "de-", "-AT", "-", "xx-AT", "de-XX", "de-AT-1901", "ger-AT", "de_AT"}) {
        auto id = findLanguageId(spelling, ELanguageIdKind::languageAndCountry);
        EXPECT_FALSE(id.valid) << spelling;
        EXPECT_EQ(id.index, -1) << spelling;
        EXPECT_EQ(id.bibliographicCode, nullptr) << spelling;
        EXPECT_EQ(id.countryCode, nullptr) << spelling;
    }
}

TEST(LanguageId, ComparesEachKindWithItsColumn) {
    EXPECT_EQ(text(findLanguageId("afar", ELanguageIdKind::languageName).bibliographicCode), u"aar");
    EXPECT_EQ(text(findLanguageId("CY", ELanguageIdKind::shortCode).languageName), u"Welsh");
    EXPECT_EQ(text(findLanguageId("wel/cym", ELanguageIdKind::bibliographicCode).languageName), u"Welsh");
    EXPECT_EQ(text(findLanguageId("afghanistan", ELanguageIdKind::countryName).countryCode), u"AF");
    EXPECT_TRUE(findLanguageId("AF", ELanguageIdKind::countryCode).valid);
    EXPECT_FALSE(findLanguageId("af", ELanguageIdKind::countryCode).valid);
    EXPECT_FALSE(findLanguageId("wel", ELanguageIdKind::bibliographicCode).valid);
}
