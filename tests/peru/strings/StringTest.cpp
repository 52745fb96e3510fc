#include "peru/strings/String.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringSupport.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <string>
#include <thread>

using namespace peru;
using namespace peru::literals;
using tests::bytesOf;
using tests::decode;

namespace {

int sign(int value) {
    return (value > 0) - (value < 0);
}

// The hash as it is defined, one code point at a time.
uint32_t modelHash(const std::u32string& text) {
    int32_t h = 0;
    for (char32_t c : text)
        h = static_cast<int32_t>(static_cast<uint32_t>(h & 0x0FFFFFFF) << 3) ^
            (((h >> 2) ^ static_cast<int32_t>(c)) & 0x7FFFFFFF);
    return static_cast<uint32_t>(h);
}

std::u32string randomText(std::mt19937& random, const std::u32string& alphabet, size_t maxLength) {
    std::u32string text(random() % (maxLength + 1), U'\0');
    for (char32_t& ch : text) ch = alphabet[random() % alphabet.size()];
    return text;
}

const std::u32string kAlphabets[] = {
    U"ab",
    U"ab\u00E9",
    U"a\u00E9\u03B1\u20AC",
    U"a\uFFFD\uE000\U00050000\U0010FFFF",
};

// Two texts in two of the encodings that hold them, with or without malformed bytes between the characters.
struct SPair {
    std::u32string a, b;
    P<IString> sa, sb;
};

template <class F> void forRandomPairs(unsigned seed, F&& f) {
    std::mt19937 random(seed);
    auto encodings = tests::getAllEncodings();
    for (int round = 0; round < 4000; ++round) {
        const std::u32string& alphabet = kAlphabets[random() % std::size(kAlphabets)];
        SPair pair;
        pair.a = randomText(random, alphabet, random() % 2 ? 8 : random() % 8 ? 60 : 1500);
        pair.b = random() % 4 ? randomText(random, alphabet, 4) : pair.a;
        if (random() % 4 == 0) pair.b = pair.a.substr(0, random() % (pair.a.size() + 1)) + pair.b;
        std::string trace;
        const auto encode = [&](const std::u32string& text) {
            P<ICharEncoding> encoding;
            do encoding = encodings[random() % encodings.size()];
            while (!tests::canEncode(encoding, text));
            const P<IString> string = tests::encode(encoding, text, random() % 3 ? nullptr : &random);
            trace += std::string(encoding->getName()) + " " + testing::PrintToString(bytesOf(string)) + " ";
            return string;
        };
        pair.sa = encode(pair.a);
        pair.sb = encode(pair.b);
        SCOPED_TRACE(trace);
        f(pair, random);
        if (testing::Test::HasFailure()) return;
    }
}

} // namespace

TEST(String, Comparing_FollowsCodePoints) {
    forRandomPairs(1, [](const SPair& p, std::mt19937& random) {
        ASSERT_EQ(decode(p.sa), p.a);
        ASSERT_EQ(p.sa->getLength(), int32_t(p.a.size()));
        ASSERT_EQ(p.sa->getHash(), modelHash(p.a));
        ASSERT_EQ(p.sa->getHash(), modelHash(p.a)) << "asked again";
        for (const int32_t outside : {-1, p.sa->getLength()})
            ASSERT_EQ(p.sa->getPosition(outside), kStringEnd);
        ASSERT_EQ(sign(p.sa->compare(p.sb)), sign(p.a.compare(p.b)));
        ASSERT_EQ(p.sa->equals(p.sb), p.a == p.b);
        ASSERT_EQ(p.sa->equalsIgnoreCase(p.sb->toUpper()), p.a == p.b);
        ASSERT_EQ(sign(p.sa->compareIgnoreCase(p.sb)), sign(p.a.compare(p.b)));
        int32_t limit = static_cast<int32_t>(random() % 10);
        ASSERT_EQ(sign(p.sa->compare(p.sb, limit)),
                  sign(p.a.substr(0, size_t(limit)).compare(p.b.substr(0, size_t(limit)))));
        ASSERT_EQ(p.sa->equals(p.sb, limit), p.a.substr(0, size_t(limit)) == p.b.substr(0, size_t(limit)));
        ASSERT_EQ(p.sa->startsWith(p.sb), p.a.starts_with(p.b));
        ASSERT_EQ(p.sa->endsWith(p.sb), p.a.ends_with(p.b));
        size_t from = random() % (p.a.size() + 1);
        size_t to = from + random() % (p.a.size() - from + 1);
        SStringPos start = p.sa->getPosition(int32_t(from));
        SStringPos end = p.sa->getPosition(int32_t(to));
        ASSERT_EQ(sign(p.sa->compareRange(start, end, p.sb)), sign(p.a.substr(from, to - from).compare(p.b)));
        ASSERT_EQ(p.sa->startsWithAt(start, p.sb), p.a.substr(from).starts_with(p.b));
        size_t there = from + random() % 20 - 10; // wraps around before the start
        SStringPos moved = p.sa->movePosition(start, int32_t(there - from));
        ASSERT_EQ(moved, there < p.a.size() ? p.sa->getPosition(int32_t(there)) : kStringEnd);
        ASSERT_EQ(p.sa->getCharAt(int32_t(there)), there < p.a.size() ? p.a[there] : U'\0');
    });
}

TEST(String, Finding_StaysWithinItsRange) {
    forRandomPairs(2, [](const SPair& p, std::mt19937& random) {
        size_t from = random() % (p.a.size() + 1);
        size_t to = from + random() % (p.a.size() - from + 1);
        SStringPos start = p.sa->getPosition(int32_t(from));
        SStringPos end = p.sa->getPosition(int32_t(to));
        std::u32string part = p.a.substr(from, to - from);
        auto expected = [&](size_t place) {
            return place == std::u32string::npos ? -1 : int32_t(place + from);
        };
        bool empty = p.b.empty();
        ASSERT_FALSE(p.sa->find(p.sb, end, start).isFound() && from != to);
        ASSERT_FALSE(p.sa->findChar(0x110000, start, end).isFound());
        SStringPos found = p.sa->find(p.sb, start, end);
        ASSERT_EQ(found.index, expected(part.find(p.b)));
        if (found.isFound() && !empty) {
            ASSERT_TRUE(p.sa->startsWithAt(found, p.sb)) << "offset " << found.offset;
            ASSERT_EQ(p.sa->getCharAt(found), p.b[0]);
        }
        if (!empty) {
            ASSERT_EQ(p.sa->findChar(p.b[0], start, end).index, expected(part.find(p.b[0])));
            ASSERT_EQ(p.sa->findAnyOf(p.sb, start, end).index, expected(part.find_first_of(p.b)));
        }
        if (p.sa->isEncoding(ICharEncoding::kCodePage)) {
            ASSERT_THROW(p.sa->findLast(p.sb, start, end), CMethodNotImplementedError);
            ASSERT_THROW(p.sa->findLastChar('a'), CMethodNotImplementedError);
            ASSERT_THROW(p.sa->findLastAnyOf("a"), CMethodNotImplementedError);
            return;
        }
        ASSERT_EQ(p.sa->findLast(p.sb, start, end).index, expected(part.rfind(p.b)));
        ASSERT_FALSE(p.sa->findLast(p.sb, end, start).isFound() && from != to);
        ASSERT_FALSE(p.sa->findLastChar(0x110000, start, end).isFound());
        if (empty) return;
        ASSERT_EQ(p.sa->findLastChar(p.b[0], start, end).index, expected(part.rfind(p.b[0])));
        ASSERT_EQ(p.sa->findLastAnyOf(p.sb, start, end).index, expected(part.find_last_of(p.b)));
    });
}

TEST(String, Editing_MatchesAModel) {
    forRandomPairs(3, [](const SPair& p, std::mt19937& random) {
        ASSERT_EQ(decode(p.sa->concat(p.sb)), p.a + p.b);
        size_t from = random() % (p.a.size() + 1);
        size_t count = random() % (p.a.size() - from + 1);
        SStringPos pos = p.sa->getPosition(int32_t(from));
        std::u32string model = p.a;
        P<IString> inserted = p.sa->insert(pos, p.sb);
        ASSERT_EQ(decode(inserted), model.insert(from, p.b));
        ASSERT_TRUE(inserted->isTerminated());
        model = p.a;
        ASSERT_EQ(decode(p.sa->replaceRange(pos, int32_t(count), p.sb)), model.replace(from, count, p.b));
        model = p.a;
        ASSERT_EQ(decode(p.sa->remove(pos)), model.erase(from));
        ASSERT_EQ(decode(p.sa->substring(pos, p.sa->movePosition(pos, int32_t(count)))),
                  p.a.substr(from, count));

        std::u32string wanted = p.a.substr(from, 1 + random() % 2);
        P<IString> search = tests::encode(getUTF32CharEncoding(), wanted);
        model.clear();
        size_t done = 0;
        for (size_t at; !wanted.empty() && (at = p.a.find(wanted, done)) != std::u32string::npos;) {
            model += p.a.substr(done, at - done) + p.b;
            done = at + wanted.size();
        }
        model += p.a.substr(done);
        ASSERT_EQ(decode(p.sa->replace(search, p.sb)), model);
        for (const P<IString>& converted :
             {p.sa->toUTF8String(), p.sa->toUTF16String(), p.sa->toWCharString(), p.sa->toCPString()})
            ASSERT_EQ(decode(converted), p.a);
    });
}

TEST(String, Storage_SharesWhatItMay) {
    auto* block = static_cast<char*>(std::malloc(3));
    std::memcpy(block, "abc", 3);
    P<IString> adopted = make<CString>(getUTF8CharEncoding(), block, 3, EStringStorage::adopt);
    EXPECT_EQ(static_cast<const void*>(adopted->getData()), block);
    EXPECT_FALSE(adopted->isTerminated());
    EXPECT_STREQ(reinterpret_cast<const char*>(adopted->getTerminated()->getData()), "abc");
    EXPECT_EQ(newString(static_cast<const char*>(nullptr)), (TNullString<char, CLatin1String>::get()));
    EXPECT_EQ(newString(static_cast<const wchar_t*>(nullptr)), (TNullString<wchar_t, CWCharString>::get()));
    EXPECT_TRUE(newString(L"x")->equals("x") && make<CUTF16String>(nullptr)->isTerminated());
}

TEST(String, Slice_OutlivesItsParentAndDoesNotChain) {
    P<IString> parent = newString(u"one two three");
    const uint8_t* bytes = parent->getData();
    P<IString> slice = parent->substring(parent->getPosition(4));
    EXPECT_TRUE(slice->isTerminated()) << "it ends where its parent does";
    P<IString> inner = slice->substring(kStringBegin, slice->getPosition(3));
    EXPECT_FALSE(inner->isTerminated());
    EXPECT_EQ(inner->getData(), bytes + 8);
    EXPECT_EQ(parent->substring(kStringBegin), parent);
    parent = nullptr;
    slice = nullptr;
    EXPECT_TRUE(inner->equals("two"));
    EXPECT_EQ(CString::toStdU16String(inner->toUTF16String()), u"two");
}

TEST(String, Operations_ChooseTheEncodingOfTheirResult) {
    const P<IString> latin1 = newString("caf\xE9 ");
    const P<IString> greek = latin1->concat(u"\u03B1");
    // UTF-16 does not hold a lone surrogate that comes in from UTF-8, and UTF-8 does not read again all that
    // UTF-16 holds.
    const P<IString> hindi = newString(u"\u0905-\u0906");
    const P<IString> surrogate = make<CUTF8String>("abcdefghijklm\xED\xA0\x80");
    constexpr uint32_t kLatin1 = ICharEncoding::kLatin1, kUTF8 = ICharEncoding::kUTF8,
                       kUTF16 = ICharEncoding::kUTF16;
    const std::tuple<P<IString>, uint32_t, const char32_t*> cases[] = {
        {greek, kUTF8, U"caf\u00E9 \u03B1"},
        {latin1->concat(u"\u00E9"), kLatin1, U"caf\u00E9 \u00E9"},
        {latin1->replace("\xE9", L"\x3B1"), kUTF8, U"caf\u03B1 "},
        {u"\u03B1" + latin1, kUTF16, U"\u03B1caf\u00E9 "},
        {L"\u03B1" + (latin1 + u"x" + L"y"), ICharEncoding::kUTF32, U"\u03B1caf\u00E9 xy"},
        {greek->toLatin1String(), kLatin1, U"caf\u00E9 ?"},
        {newString("\xFF")->toUpper(), kUTF8, U"\u0178"},
        {newString(u"\u00C4\u0416Z")->toLower(), kUTF16, U"\u00E4\u0436z"},
        {newString("ma\xDF")->toUpper(), kLatin1, U"MA\u00DF"},
        {hindi->replace("-", surrogate), kUTF16, U"\u0905abcdefghijklm?\u0906"},
        {hindi->replaceRange(hindi->getPosition(1), 1, surrogate), kUTF16, U"\u0905abcdefghijklm?\u0906"},
        {hindi + surrogate, kUTF16, U"\u0905-\u0906abcdefghijklm?"},
        // Half a unit at the end is left out.
        {make<CString>(getUTF16CharEncoding(), "a\0b\0c", 5)->concat(u"d"), kUTF16, U"abd"},
        {newString(u"x")->concat(CStringArg(*getUTF16CharEncoding(), "a\0b", 3)), kUTF16, U"xa"},
        {newString("abc")->replace("x", "y"), kLatin1, U"abc"},
        {newString("abc")->replace("", "y"), kLatin1, U"abc"},
        {newString("abcabc")->replace("abc", ""), kLatin1, U""},
        {newString("abcabc")->replace("b", "--", latin1->getPosition(2)), kLatin1, U"abca--c"},
        {newString("abcabc")->replace("bc", "-", kStringBegin, latin1->getPosition(4)), kLatin1, U"a-abc"},
        {"a" + P<IString>(), kLatin1, U"a"}, // an empty handle is an empty text
        {newString("/-a/b-/")->trim("-/"), kLatin1, U"a/b"},
        {newString(u"\u03B1x\u03B1")->trim(u"\u03B1"), kUTF16, U"x"},
        {newString("a")->concat(static_cast<const wchar_t*>(nullptr)), kLatin1, U"a"},
        {newString("a")->concat(static_cast<const char16_t*>(nullptr)), kLatin1, U"a"},
        {newString("a")->concat(CStringArg(*getLatin1CharEncoding(), nullptr, 5)), kLatin1, U"a"},
        {newString("a")->concat(CStringArg(*getLatin1CharEncoding(), "b", 0)), kLatin1, U"a"},
        {surrogate->toCPString(), ICharEncoding::kCodePage, U"abcdefghijklm?"},
    };
    for (const auto& [result, encoding, expected] : cases) {
        EXPECT_EQ(decode(result), expected);
        EXPECT_TRUE(result->isEncoding(encoding)) << bytesOf(result);
    }
}

// Bytes that the decoder rejects are kept by edits and never become characters.
TEST(String, MalformedBytes_AreInvisibleButKept) {
    const auto raw = [](const char* bytes) { return P<IString>(make<CUTF8String>(bytes)); };
    const P<IString> smile = raw("a\xF0\x9F\x98\x80z");
    EXPECT_EQ(smile->getLength(), 2);
    EXPECT_TRUE(smile->equals("az"));
    const P<IString> tail = smile->remove(smile->getPosition(1));
    const P<IString> padded = raw(" \xF0\x9F\x98\x80 x\xFF ");
    SStringPos pos = kStringBegin;
    const std::pair<P<IString>, const char*> cases[] = {
        {"x: " + smile, "x: a<>z"},
        {smile->concat(smile), "a<>za<>z"},
        {smile->replaceRange(smile->getPosition(1), 0, "-"), "a<>-z"},
        {smile->replaceRange(kStringBegin, 0, "-"), "-a<>z"},
        {smile->replaceRange(kStringBegin, 1, "-"), "-<>z"},
        {smile->replace("a", "-"), "-<>z"},
        {smile->replace("z", ""), "a<>"},
        {tail, "a<>"},
        {tail->remove(kStringBegin, 1), "<>"},
        {tail->nextToken(pos, "a"), ""},
        {tail->nextToken(pos, "a"), "<>"},
        {padded->trim(), "<> x\xFF"},
        {padded->trim(" x"), "<> x\xFF"},
        {fillPlaceholders(raw("%A%\xF0\x9F\x98\x80"), {{"%A%", tail}}), "a<><>"},
        {raw("x\xC3z\xA9y")->replace("z", ""), "x\xC3y"},
        {raw("x\xC3z\xA9y")->remove(smile->getPosition(9), 0), "x\xC3z\xA9y"},
        {raw("\xC3z\xA9y")->remove({0, 1}, 1), "\xC3y"},
        {raw("a\xC3")->concat(raw("\xA9z")), "a\xC3z"},
    };
    for (const auto& [result, expected] : cases) {
        std::string bytes = CString::toStdString(result);
        for (size_t at; (at = bytes.find("\xF0\x9F\x98\x80")) != std::string::npos;)
            bytes.replace(at, 4, "<>");
        EXPECT_EQ(bytes, expected);
    }
    EXPECT_EQ(bytesOf(make<CCPString>(" x \xFF")->trim()), "x \xFF");
    EXPECT_EQ(newString(u"\x0800")->toUTF8String()->getLength(), 0);
    EXPECT_EQ(CString::toStdString(newString(u"\x0800")), "\xE0\xA0\x80");
    EXPECT_TRUE(raw("\xC1\x81")->equals("A")) << "an over-long spelling that passes";
    EXPECT_TRUE(raw("\xC1\x81z")->find("Az").isFound());
    EXPECT_EQ(CString::toStdU16String(raw("\xED\xA0\x80")), u"\uFFFD");
}

// Valid UTF-8 that UTF-8 strings cannot read arrives in UTF-16; invalid bytes come back as they are.
TEST(String, TextFromOutside_KeepsItsCharacters) {
    std::mt19937 random(5);
    for (char32_t ch = 1; ch < 0x110000; ch += 1 + random() % 40) {
        if (ch >= 0xD800 && ch < 0xE000) continue;
        const std::u32string model = {U'a', ch};
        const std::string bytes = bytesOf(tests::encode(getUTF8CharEncoding(), model));
        ASSERT_EQ(decode(CString::fromUTF8(bytes)), model);
        ASSERT_EQ(CString::toStdString(CString::fromUTF8(bytes)), bytes);
    }
    for (const char* bytes : {"\xF0\x9F\x98", "\xE0\x9F\x80", "\xF0\x8F\x80\x80", "\xE0\xA0\x80\xFF",
                              "\xF0\x9F\x98\x80\xED\xA0\x80"}) {
        EXPECT_TRUE(CString::fromUTF8(bytes)->isEncoding(ICharEncoding::kUTF8));
        EXPECT_EQ(CString::toStdString(CString::fromUTF8(bytes)), bytes);
    }
}

TEST(String, Tokens_EndWithAnEmptyHandle) {
    P<IString> text = newString("one--two-three");
    SStringPos pos = kStringBegin;
    for (const char* token : {"one", "two-three"})
        EXPECT_TRUE(text->nextTokenByString(pos, "--")->equals(token));
    EXPECT_FALSE(text->nextTokenByString(pos, "--"));
}

TEST(String, Trim_CutsBothEnds) {
    const std::pair<const char32_t*, const char32_t*> cases[] = {
        {U" \t\r\na b\n ", U"a b"}, {U"ab", U"ab"}, {U"  ", U""}, {U"", U""}, {U"\u00A0x\u2003", U"x"}};
    for (const auto& [text, trimmed] : cases)
        for (const P<ICharEncoding>& encoding : tests::getAllEncodings())
            if (tests::canEncode(encoding, text)) {
                EXPECT_EQ(decode(tests::encode(encoding, text)->trim()), trimmed) << encoding->getName();
            }
}

TEST(String, Comparing_IgnoresCaseAndRefusesOtherObjects) {
    EXPECT_TRUE(newString(u"\u00C4xy")->equalsIgnoreCase("\xE4XY"));
    EXPECT_LT(newString("ABC")->compareIgnoreCase("abd"), 0);
    EXPECT_TRUE(newString("ABx")->equalsIgnoreCase("aby", 2));
    EXPECT_GT(newString("a")->compareTo(newString(u"A")), 0);
    EXPECT_THROW(newString("a")->compareTo(getUTF8CharEncoding()), CInvalidArgError);
}

TEST(String, Shutdown_LeavesStringsUsable) {
    P<IString> before = CString::empty();
    CGlobalObjFactory::shutdown();
    EXPECT_EQ(CString::empty(), before);
    EXPECT_TRUE(("a" + newString(u"b"))->equals("ab"));
}
