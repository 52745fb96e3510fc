#include "peru/strings/ICharEncoding.h"

#include "peru/Errors.h"
#include "peru/strings/StringSupport.h"

#include "support/Environment.h"

#include <gtest/gtest.h>

#include <string>

using namespace peru;
using namespace std::string_literals;

namespace {

const uint8_t* raw(const std::string& bytes) {
    return reinterpret_cast<const uint8_t*>(bytes.data());
}

int32_t sizeOf(const std::string& bytes) {
    return static_cast<int32_t>(bytes.size());
}

// Characters after malformed bytes, in buffers that end exactly behind them or one byte too early.
void expectExactPositions(const P<ICharEncoding>& encoding) {
    SCOPED_TRACE(encoding->getName());
    constexpr int32_t kSize = 80;
    uint8_t buffer[kSize] = {};
    std::vector<int32_t> starts;
    std::mt19937 random(2);
    char32_t out = 0;
    int32_t end = 0;
    for (char32_t ch : U"a\0\u00E9\u20AC\U0010FFFF"s) {
        if (!tests::canEncode(encoding, {ch})) continue;
        const std::string noise = end > 0 ? tests::getNoise(encoding, random) : "";
        const int32_t before = end, start = end + sizeOf(noise);
        std::memcpy(buffer + end, noise.data(), noise.size());
        starts.push_back(start);
        EXPECT_EQ(encoding->encodeChar(ch, buffer, kSize, -1), -1);
        end = encoding->encodeChar(ch, buffer, start + encoding->getEncodedSize(ch), start);
        EXPECT_EQ(encoding->encodeChar(ch, buffer, end - 1, start), start) << "does not fit";
        EXPECT_EQ(encoding->getEncodedSize(ch), end - start);
        EXPECT_GE(encoding->getMaxCharSize(), end - start);
        EXPECT_EQ(encoding->getCharSizeAt(buffer, end, start), end - start);
        EXPECT_EQ(encoding->getCharSizeAt(buffer, end - 1, start), -1) << "cut off";
        EXPECT_EQ(encoding->decodeChar(out, buffer, end, start), end);
        EXPECT_EQ(out, ch);
        EXPECT_EQ(encoding->findValidChar(buffer, end, before), start);
        EXPECT_EQ(encoding->findValidChar(buffer, end - 1, start), -1) << "cut off";
        EXPECT_EQ(encoding->decodeNextChar(out, buffer, end, before), end);
        EXPECT_EQ(encoding->decodeChar(out, buffer, end, before), noise.empty() ? end : -1);
    }
    const int32_t count = static_cast<int32_t>(starts.size());
    for (int32_t i = 0; i < count; ++i)
        EXPECT_EQ(encoding->advance(buffer, end, i), starts[static_cast<size_t>(i)]);
    for (int32_t outside : {-1, count}) EXPECT_EQ(encoding->advance(buffer, end, outside), -1);
    EXPECT_EQ(encoding->countChars(buffer, end, -9), count);
    EXPECT_EQ(encoding->getTerminatedLength(buffer), starts[1]);
    EXPECT_EQ(encoding->findValidChar(buffer, end, -9), starts[0]);
    EXPECT_EQ(encoding->decodeNextChar(out, buffer, end, -9), starts[0] + encoding->getEncodedSize('a'));
    for (int32_t outside : {-1, end})
        EXPECT_EQ(encoding->getCharSizeAt(buffer, end, outside) +
                      encoding->decodeChar(out, buffer, end, outside),
                  -2);
    EXPECT_EQ(encoding->findValidChar(buffer, end, end) + encoding->decodeNextChar(out, buffer, end, end),
              -2);
    EXPECT_EQ(encoding->getEncodedSize(0x110000), 0);
    EXPECT_EQ(encoding->encodeChar(0x110000, buffer, kSize, 1), 1);
    if (encoding->getId() == ICharEncoding::kCodePage) return;
    for (int32_t outside : {0, end + 1})
        EXPECT_EQ(encoding->decodePrevChar(out, buffer, end, outside), -1) << outside;
    EXPECT_EQ(encoding->decodePrevChar(out, buffer, end, starts[0]), -1);
}

} // namespace

TEST(CharEncoding, PositionsAndSizesAreExact) {
    for (const P<ICharEncoding>& encoding : tests::getAllEncodings())
        if (encoding->getId() != ICharEncoding::kCodePage) expectExactPositions(encoding);
}

TEST(CharEncoding, UTF8_EncodesEveryCodePointAndRejectsThreeLeadBytes) {
    P<ICharEncoding> utf8 = getUTF8CharEncoding();
    for (char32_t ch = 0; ch < 0x110000; ++ch) {
        uint8_t buffer[4];
        int32_t size = utf8->encodeChar(ch, buffer, 4, 0);
        ASSERT_EQ(size, utf8->getEncodedSize(ch)) << std::hex << uint32_t(ch);
        bool rejected = (ch >= 0x800 && ch < 0x1000) || (ch >= 0x10000 && ch < 0x40000);
        char32_t back = 0;
        ASSERT_EQ(utf8->decodeChar(back, buffer, size, 0), rejected ? -1 : size) << std::hex << uint32_t(ch);
        if (!rejected) {
            ASSERT_EQ(back, ch);
            ASSERT_EQ(utf8->decodePrevChar(back, buffer, size, size), 0);
            ASSERT_EQ(back, ch);
            ASSERT_EQ(utf8->decodeChar(back, buffer, size - 1, 0), -1) << "cut off";
        }
    }
}

TEST(CharEncoding, UTF8_JudgesSequences) {
    const auto judge = [](const std::string& bytes) {
        return getUTF8CharEncoding()->getCharSizeAt(raw(bytes), sizeOf(bytes), 0);
    };
    // Only an all-zero payload of the lead byte counts as over-long; surrogates pass.
    for (const char* good : {"a", "\xC1\x81", "\xC3\xA9", "\xE2\x82\xAC", "\xED\xA0\x80", "\xF4\x8F\xBF\xBF"})
        EXPECT_EQ(judge(good), sizeOf(good)) << testing::PrintToString(good);
    for (const char* bad : {"\x80", "\xC0\x80", "\xC3\x41", "\xE0\xA0\x80", "\xF0\x9F\x98\x80",
                            "\xF4\x90\x80\x80", "\xF8\x88\x80\x80", "\xFF"})
        EXPECT_EQ(judge(bad), -1) << testing::PrintToString(bad);
}

TEST(CharEncoding, UTF16_TakesPairsOnly) {
    P<ICharEncoding> utf16 = getUTF16CharEncoding();
    uint8_t buffer[4];
    ASSERT_EQ(utf16->encodeChar(0x1F600, buffer, 4, 0), 4);
    EXPECT_EQ(std::memcmp(buffer, u"\U0001F600", 4), 0);
    for (char32_t surrogate : {0xD800, 0xDFFF}) EXPECT_EQ(utf16->getEncodedSize(surrogate), 0);
    const std::string loneHigh("\x3D\xD8\x61\x00", 4);
    EXPECT_EQ(utf16->countChars(raw(loneHigh), 3, 0), 0) << "half a unit at the end";
}

// Random bytes, read from either end and one at a time or in bulk, give the same characters.
TEST(CharEncoding, Directions_Agree) {
    std::mt19937 random(1);
    static const uint8_t kLikely[] = {'a',  0x80, 0xA9, 0xC1, 0xC3, 0xE0, 0xE2,
                                      0xED, 0xF0, 0xF1, 0xF4, 0xD8, 0xDC, 0};
    for (int round = 0; round < 3000; ++round) {
        std::string bytes(random() % 40, '\0');
        for (char& byte : bytes) byte = static_cast<char>(kLikely[random() % std::size(kLikely)]);
        for (const P<ICharEncoding>& encoding : tests::getAllEncodings()) {
            if (encoding->getId() == ICharEncoding::kCodePage) continue;
            std::u32string forward, backward, bulk;
            std::vector<int32_t> starts, backStarts;
            char32_t ch;
            const uint8_t* data = raw(bytes);
            const int32_t size = sizeOf(bytes);
            for (int32_t pos = 0; (pos = encoding->findValidChar(data, size, pos)) >= 0;) {
                starts.push_back(pos);
                pos = encoding->decodeChar(ch, data, size, pos);
                ASSERT_GT(pos, starts.back());
                forward.push_back(ch);
            }
            for (int32_t pos = sizeOf(bytes);
                 (pos = encoding->decodePrevValidChar(ch, data, size, pos)) >= 0;) {
                backward.insert(backward.begin(), ch);
                backStarts.insert(backStarts.begin(), pos);
            }
            ASSERT_EQ(forward, backward) << encoding->getName() << testing::PrintToString(bytes);
            ASSERT_EQ(starts, backStarts);
            ASSERT_EQ(encoding->countChars(data, size, 0), int32_t(forward.size()));
            char32_t chars[3];
            int32_t offsets[3];
            int32_t count = 0;
            for (int32_t pos = 0; pos >= 0;) {
                pos = encoding->decodeChars(chars, 3, count, data, size, pos, offsets);
                for (int32_t i = 0; i < count; ++i) ASSERT_EQ(offsets[i], starts[bulk.size() + size_t(i)]);
                bulk.append(chars, size_t(count));
            }
            ASSERT_EQ(forward, bulk);
            for (size_t i = 0; i < starts.size(); ++i)
                ASSERT_EQ(encoding->advance(data, size, int32_t(i)), starts[i]);
            ASSERT_EQ(encoding->advance(data, size, int32_t(starts.size())), -1);
        }
    }
}

// Each in a process of its own, since the locale is chosen once. The process itself has not set any.
TEST(CharEncoding, CodePage_FollowsTheEnvironmentForwardsOnly) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    const auto check = [] {
        P<ICharEncoding> cp = getCPCharEncoding();
        std::string text = "a\xFF\xE2\x82\xAC"; // malformed in the middle
        char32_t chars[4];
        int32_t offsets[4];
        int32_t count = 0;
        EXPECT_EQ(cp->decodeChars(chars, 4, count, raw(text), sizeOf(text), 0, offsets), 5);
        EXPECT_EQ(count, 2);
        EXPECT_EQ(chars[1], U'\u20AC');
        EXPECT_EQ(offsets[1], 2);
        EXPECT_EQ(cp->getEncodedSize(0xD800), 0);
        expectExactPositions(cp);
        EXPECT_EQ(cp->countChars(raw("\xF4\x90\x80\x80"), 4, 0), 0) << "beyond Unicode";
        EXPECT_STREQ(CException(newString(u"\u20AC"), nullptr).what(), "\xE2\x82\xAC");
        EXPECT_THROW(cp->findPrevChar(raw(text), 5, 5), CMethodNotImplementedError);
        EXPECT_THROW(cp->decodePrevChar(chars[0], raw(text), 5, 5), CMethodNotImplementedError);
        EXPECT_THROW(cp->decodePrevValidChar(chars[0], raw(text), 5, 5), CMethodNotImplementedError);
        EXPECT_THROW(cp->decodeCharsBackward(chars, 4, count, raw(text), 5, 5, nullptr),
                     CMethodNotImplementedError);
        std::exit(testing::Test::HasFailure());
    };
    for (const char* locale : {"C.UTF-8", "C", "xx_XX.UTF-8"}) {
        const tests::CEnvironment environment("LC_ALL", locale);
        EXPECT_EXIT(check(), testing::ExitedWithCode(0), "") << locale;
    }
}
