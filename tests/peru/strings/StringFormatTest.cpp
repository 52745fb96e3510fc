#include "peru/strings/StringFormat.h"

#include "peru/Errors.h"
#include "support/Environment.h"
#include "support/Files.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <clocale>
#include <cmath>
#include <cstdio>
#include <random>
#include <string>

using namespace peru;

namespace {

template <class... Values> std::string failure(const char* text, const Values&... values) {
    return tests::errorOf<CInvalidArgError>([&] { format(text, values...); });
}

std::string randomField(std::mt19937& random, const char* flags) {
    std::string field = "<%";
    for (const char* flag = flags; *flag; ++flag)
        if (random() % 4 == 0) field += *flag;
    if (random() % 2) field += std::to_string(1 + random() % 30);
    if (random() % 2) field += "." + (random() % 4 ? std::to_string(random() % 12) : "");
    return field;
}

} // namespace

TEST(StringFormat, Integers_PrintAsInC) {
    std::mt19937_64 values(1);
    std::mt19937 random(2);
    static const char* kModifiers[] = {"", "l", "ll", "h", "hh", "z", "j", "t", "I64", "L"};
    for (int round = 0; round < 20000; ++round) {
        char conversion = "dioxXu"[random() % 6];
        bool isSigned = conversion == 'd' || conversion == 'i';
        std::string field = randomField(random, isSigned ? "-+0 " : "-0#");
        auto value = static_cast<int64_t>(values()) >> (random() % 64);
        if (random() % 10 == 0) value = 0;
        char expected[128];
        std::string judge = field + "ll" + conversion + ">";
        std::string ours = field + kModifiers[random() % std::size(kModifiers)] + conversion + ">";
        std::snprintf(expected, sizeof(expected), judge.c_str(), static_cast<long long>(value));
        ASSERT_EQ(CString::toStdString(format(ours.c_str(), value)), expected) << ours << " of " << value;
    }
}

TEST(StringFormat, Doubles_PrintAsInCWithAPoint) {
    std::mt19937 random(3);
    // A locale of our own, since no other is sure to be installed.
    const tests::CTempFolder folder;
    const auto source = folder.write("source", "LC_NUMERIC\ndecimal_point \",\"\nthousands_sep \".\"\n"
                                               "grouping 3;3\nEND LC_NUMERIC\n");
    tests::run({"localedef", "-c", "-i", source, "-f", "/dev/null", folder / "comma"});
    const tests::CEnvironment locales("LOCPATH", folder.path().string());
    ASSERT_TRUE(std::setlocale(LC_NUMERIC, "comma"));
    for (int round = 0; round < 20000; ++round) {
        std::string field = randomField(random, "-+0 #") + "eEfgG"[random() % 5] + ">";
        double value =
            std::ldexp(static_cast<double>(random()) - 2e9, static_cast<int>(random() % 200) - 120);
        char expected[256];
        std::snprintf(expected, sizeof(expected), field.c_str(), value);
        std::string judged = expected;
        for (char& ch : judged)
            if (ch == ',') ch = '.';
        ASSERT_EQ(CString::toStdString(format(field.c_str(), value)), judged) << field;
    }
    std::setlocale(LC_NUMERIC, "C");
    EXPECT_EQ(format("%.3f", 1e300)->getLength(), 305) << "longer than any buffer on the stack";
}

TEST(StringFormat, Fields_TakeEveryKindOfValue) {
    const std::pair<P<IString>, const char*> cases[] = {
        {format("100%% of %s, %d%%", "it", 5), "100% of it, 5%"},
        {format("no field %%"), "no field %"},
        {format("[%5s|%-5s|%.2s|%05s]", "abc", u"\u00E9", "abc", "x"), "[  abc|\xC3\xA9    |ab|    x]"},
        {format("%c%C%3c", 'a', U'\u20AC', L'z'), "a\xE2\x82\xAC  z"},
        {format("%*d|%-*d|%*d|%.*f", 4, 7, 4, 7, -4, 7, 2, 1.239), "   7|7   |7   |1.24"},
        {format("%.*s|%.*s", 2, "abc", -1, "abc"), "ab|abc"}, // a negative precision counts as not given
        {format("%.d|%.0x|%#.o", 0, 0, 0), "||0"},
        {format("%x %u %x", -1, -1, int64_t(-1)), "ffffffff 4294967295 ffffffffffffffff"},
        {format("%d %u", uint32_t(4000000000), uint64_t(-1)), "4000000000 18446744073709551615"},
        {format("%d", INT64_MIN), "-9223372036854775808"},
    };
    for (const auto& [formatted, expected] : cases) EXPECT_EQ(tests::text(formatted), expected);
}

TEST(StringFormat, Result_IsInTheFormatsEncodingWhereThatHoldsIt) {
    EXPECT_TRUE(format("%s", u"\u00E9")->isEncoding(ICharEncoding::kLatin1));
    EXPECT_TRUE(format("%s", u"\u03B1")->isEncoding(ICharEncoding::kUTF8));
    EXPECT_TRUE(format(u"%s", "a")->isEncoding(ICharEncoding::kUTF16));
    EXPECT_EQ(CString::toStdString(format("\xE9 %s", CString::fromUTF8("\xF0\x9F\x98\x80"))),
              "\xC3\xA9 \xF0\x9F\x98\x80")
        << "bytes of names that only others can decode";
}

TEST(StringFormat, Errors_NameTheFormat) {
    const std::string invalid = "invalid format string in '";
    const std::string mismatch = "argument does not match the field's format spec"
                                 "ification for '";
    const std::pair<std::string, std::string> cases[] = {
        {failure("%-+0 #-d", 1), "too many field flags specified in '%-+0 #-d'"},
        {failure("a %y", 1), invalid + "a %y'"},
        {failure("%", 1), invalid + "%'"},
        {failure("%5", 1), invalid + "%5'"},
        {failure("%lld%lF", 1), invalid + "%lld%lF'"},
        {failure("%99999999999d", 1), invalid + "%99999999999d'"},
        {failure("%d", "text"), mismatch + "%d'"},
        {failure("text", 1), mismatch + "text'"},
        {failure("%s", 1), "CStringFormat::doInt"},
        {failure("%s", 1.0), "CStringFormat::doDouble"},
        {failure("%d", "text"), "CStringFormat::doString"},
        {failure("%d", 'c'), "CStringFormat::doChar"},
        {failure("%*d", "text"), "expected integer value (field width) in '%*d'"},
        {failure("%.*f", 1.0), "expected integer value (field precision) in '%.*f'"},
        {tests::errorOf<CError>([] { format("%d %d", 1); }),
         "CStringFormat: not all parameters have been pushed in yet."},
    };
    for (const auto& [error, part] : cases) EXPECT_NE(error.find(part), std::string::npos) << error;
    EXPECT_NO_THROW(format("%-+0 #d", 1)) << "five flags pass";
}
