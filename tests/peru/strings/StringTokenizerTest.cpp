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
    using Tokens = std::vector<std::string>;
    const std::tuple<const char*, Tokens, Tokens> cases[] = {{"", {}, {}},
                                                             {"a", {"a"}, {"a"}},
                                                             {"a b,c", {"a", "b", "c"}, {"a", "b", "c"}},
                                                             {" a,,b ", {"", "a", "", "b", ""}, {"a", "b"}},
                                                             {",", {"", ""}, {}}};
    EXPECT_EQ(list(make<CStringTokenizerEnum>(nullptr, ",")).size(), 0u);
    for (const auto& [text, all, filled] : cases) {
        EXPECT_EQ(list(make<CStringTokenizerEnum>(newString(text), ", ")), all) << text;
        EXPECT_EQ(list(make<CStringTokenizerEnum>(newString(text), u", ", true)), filled) << text;
    }
}

TEST(StringTokenizer, Lines_EndInThreeWays) {
    const std::pair<const char16_t*, std::vector<std::string>> cases[] = {
        {u"", {}},
        {u"a", {"a"}},
        {u"a\n", {"a"}},
        {u"a\r\nb\rc\nd", {"a", "b", "c", "d"}},
        {u"\n", {""}},
        {u"\r\r\n\n", {"", "", ""}},
        {u"a\n\rb", {"a", "", "b"}},
        {u"\u00E9\n\u20AC", {"\xC3\xA9", "\xE2\x82\xAC"}}};
    // Lines of bytes that strings cannot decode are lines.
    EXPECT_EQ(list(make<CStringLineTokenizerEnum>(make<CUTF8String>("\xFF\r\xFE\n\xFD"))),
              (std::vector<std::string>{"\xFF", "\xFE", "\xFD"}));
    for (const auto& [text, lines] : cases) {
        EXPECT_EQ(list(make<CStringLineTokenizerEnum>(newString(text))), lines);
        EXPECT_EQ(list(make<CStringLineTokenizerEnum>(newString(text)->toUTF8String())), lines);
    }
}
