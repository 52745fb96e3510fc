#include "peru/strings/StringTokenizer.h"

#include "peru/Errors.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

using namespace peru;

namespace {

std::vector<std::string> list(const P<IEnum>& parts) {
    std::vector<std::string> result;
    int32_t count = parts->getCount();
    for (WEnum<IString> typed(parts); typed.hasMore();)
        result.push_back(CString::toStdString(typed.getNext()));
    EXPECT_EQ(count, int32_t(result.size()));
    EXPECT_THROW(parts->getNext(), CEndOfEnumError);
    parts->reset();
    EXPECT_EQ(parts->hasMore(), !result.empty());
    return result;
}

} // namespace

TEST(StringTokenizer, Tokens_MayBeEmptyOrSkipped) {
    struct {
        const char* text;
        std::vector<std::string> all, filled;
    } cases[] = {
        {"", {}, {}},
        {"a", {"a"}, {"a"}},
        {"a b,c", {"a", "b", "c"}, {"a", "b", "c"}},
        {" a,,b ", {"", "a", "", "b", ""}, {"a", "b"}},
        {",", {"", ""}, {}},
    };
    EXPECT_EQ(list(make<CStringTokenizerEnum>(nullptr, ",")).size(), 0u);
    for (auto& c : cases) {
        EXPECT_EQ(list(make<CStringTokenizerEnum>(newString(c.text), ", ")), c.all) << c.text;
        EXPECT_EQ(list(make<CStringTokenizerEnum>(newString(c.text), u", ", true)), c.filled) << c.text;
    }
}

TEST(StringTokenizer, Lines_EndInThreeWays) {
    struct {
        const char16_t* text;
        std::vector<std::string> lines;
    } cases[] = {
        {u"", {}},
        {u"a", {"a"}},
        {u"a\n", {"a"}},
        {u"a\r\nb\rc\nd", {"a", "b", "c", "d"}},
        {u"\n", {""}},
        {u"\r\r\n\n", {"", "", ""}},
        {u"a\n\rb", {"a", "", "b"}},
        {u"\u00E9\n\u20AC", {"\xC3\xA9", "\xE2\x82\xAC"}},
    };
    // Lines of bytes that strings cannot decode are lines.
    EXPECT_EQ(list(make<CStringLineTokenizerEnum>(make<CUTF8String>("\xFF\r\xFE\n\xFD"))),
              (std::vector<std::string>{"\xFF", "\xFE", "\xFD"}));
    for (auto& c : cases) {
        EXPECT_EQ(list(make<CStringLineTokenizerEnum>(newString(c.text))), c.lines);
        EXPECT_EQ(list(make<CStringLineTokenizerEnum>(newString(c.text)->toUTF8String())), c.lines);
    }
}
