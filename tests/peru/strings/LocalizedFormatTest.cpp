#include "peru/strings/LocalizedFormat.h"

#include "support/Files.h"

#include <gtest/gtest.h>

using namespace peru;

TEST(LocalizedFormat, FillsTranslationsInTheirOrderAndNeverFails) {
    for (const auto& [translation, expected] : std::initializer_list<std::pair<const char*, const char*>>{
             {"", "7 of 0.50 in a"},
             {"%d/%.1f/%s", "7/0.5/a"},
             {"%3$s: %1$03d%% %2$g", "a: 007% 0.5"},
             {"%3$s: %1$d", "a: 7"},
             {"100%% %1$d %2$g %3$s", "100% 7 0.5 a"},
             // Faults: the default text is used.
             {"%s/%d/%s", "7 of 0.50 in a"},
             {"%d/%g", "7 of 0.50 in a"},
             {"%d %g %s %s", "7 of 0.50 in a"},
             {"%4$s", "7 of 0.50 in a"},
             {"%0$s", "7 of 0.50 in a"},
             {"%1$s", "7 of 0.50 in a"},
             {"%1$d %s", "7 of 0.50 in a"},
             {"%99999999999$d", "7 of 0.50 in a"},
             {"%", "7 of 0.50 in a"},
         }) {
        getStringLocalizer()->setText("test.format", newString(translation));
        const P<IString> text = format({"test.format", "%d of %.2f in %s"}, 7, 0.5, newString("a"));
        EXPECT_EQ(tests::text(text), expected) << translation;
    }
    getStringLocalizer()->clear();
    EXPECT_EQ(tests::text(format({"test.format", "plain"})), "plain");
}
