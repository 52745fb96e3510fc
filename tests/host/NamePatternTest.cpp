#include "media/NamePattern.h"

#include <gtest/gtest.h>

#include <random>
#include <stdexcept>

using host::CNamePattern;
using Fields = CNamePattern::Fields;

namespace {

// Valid as far as sequences of UTF-8 are complete.
bool isComplete(const std::string& text) {
    for (size_t i = 0; i < text.size();) {
        const auto c = static_cast<unsigned char>(text[i]);
        const size_t length = c < 0x80 ? 1 : c < 0xE0 ? 2 : c < 0xF0 ? 3 : 4;
        for (size_t k = 1; k < length; ++k)
            if (i + k >= text.size() || (text[i + k] & 0xC0) != 0x80) return false;
        i += length;
    }
    return true;
}

} // namespace

TEST(NamePattern, ExpandsFields) {
    const Fields fields{{"artist", "AC/DC"}, {"album", "..."},       {"title", ".Hack\nB.\xc2\x85 "},
                        {"track", "3/12"},   {"year", "1999-04-01"}, {"name", "in.put"}};
    const struct {
        const char* pattern;
        const char* path;
    } kCases[] = {{"%artist%/%album%/%track% - %title%", "AC-DC/Unknown Album/03 - .Hack B.flac"},
                  {"%title%", "Hack B.flac"},
                  {"%name% (%year%) 100%%", "in.put (1999) 100%.flac"},
                  {"%album-artist%_%genre%", "AC-DC_Unknown Genre.flac"},
                  {"a%comment%/..%comment%/%comment%", "a/Unknown/Unknown.flac"},
                  {". %artist%. /%track%", "AC-DC/03.flac"}};
    for (const auto& [pattern, path] : kCases) EXPECT_EQ(CNamePattern(pattern).expand(fields, ".flac"), path);
    EXPECT_EQ(CNamePattern("%title%-%track%-%year%").expand({{"name", "n"}, {"track", "A1"}}, ""),
              "n-A1-Unknown Year");
}

TEST(NamePattern, RefusesWhatIsNoRelativePathOrHasUnknownFields) {
    for (const char* pattern :
         {"", "plain", "%%", "%", "%title", "%title%%", "%Title%", "%colour%", "/%title%", "%title%/",
          "a//%title%", "../%title%", "./%title%", "%title%\n", "%artist%/%title"})
        EXPECT_THROW(CNamePattern{pattern}, std::invalid_argument) << pattern;
    try {
        CNamePattern("%colour%");
    } catch (const std::invalid_argument& error) {
        EXPECT_EQ(std::string(error.what()).find("has no field %colour%; known are %artist%, "), 0u)
            << error.what();
    }
}

TEST(NamePattern, MatchesNames) {
    using Result = std::optional<Fields>;
    const struct {
        const char* pattern;
        const char* file;
        Result fields;
    } kCases[] = {
        {"%artist% - %title%", "A - B - C.d.mp3", Fields{{"artist", "A"}, {"title", "B - C.d"}}},
        {"%artist% - %title% (%year%)", "A - B (live) (1999).mp3",
         Fields{{"artist", "A"}, {"title", "B (live)"}, {"year", "1999"}}},
        {"%artist%/%album%/%track%%title%", "/x/A/B/007 C.ogg",
         Fields{{"artist", "A"}, {"album", "B"}, {"track", "7"}, {"title", "C"}}},
        {"%artist%/%artist%-%title%", "A/A-B.ogg", Fields{{"artist", "A"}, {"title", "B"}}},
        {"%artist%/%artist%-%title%", "B/A-B.ogg", Result()},
        {"%name% - %title%", "a - b.wav", Fields{{"title", "b"}}},
        {"100%% %title%", "100% b.wav", Fields{{"title", "b"}}},
        {"%track% %title%", "x1 b.wav", Result()},
        {"%track% %title%", "1 .wav", Result()},
        {"%artist%/%title%", "b.wav", Result()},
        {"%year%", "99.wav", Result()},
    };
    for (const auto& [pattern, file, fields] : kCases)
        EXPECT_EQ(CNamePattern(pattern).match(file), fields) << pattern;
    EXPECT_FALSE(CNamePattern("%artist%%title%").canMatch());
    EXPECT_TRUE(CNamePattern("%track%%title%/%title%").canMatch());
    // Must not take exponential time
    const CNamePattern slow("%artist%a%album%a%title%a%genre%a%comment%a%album-artist%a%name%a%name%b");
    EXPECT_FALSE(slow.match(std::string(250, 'a') + ".mp3"));
}

TEST(NamePattern, AnyTextGivesASafePathBelowTheFolder) {
    const std::string zero(1, '\0'), many(90, 'n');
    const std::vector<std::string> pieces{".",
                                          "..",
                                          "/",
                                          " ",
                                          "\n",
                                          "\x7f",
                                          "%",
                                          zero,
                                          "a",
                                          "\\",
                                          "\xc3\xbc",
                                          "\xe9\x9f\xb3",
                                          "\xf0\x9f\x8e\xb5",
                                          many};
    const CNamePattern pattern("%artist%/%album%. /.%comment%/%track% %title%");
    std::mt19937 random(7);
    for (int run = 0; run < 2000; ++run) {
        Fields fields;
        for (const char* name : {"artist", "album", "comment", "track", "title"})
            for (auto i = random() % 9; i > 0; --i) fields[name] += pieces[random() % pieces.size()];
        const std::filesystem::path path = pattern.expand(fields, ".mp3");
        ASSERT_TRUE(path.is_relative());
        ASSERT_EQ(std::distance(path.begin(), path.end()), 4) << path;
        for (const std::filesystem::path& part : path) {
            const std::string& name = part.native();
            const std::string stem = part == path.filename() ? name.substr(0, name.size() - 4) : name;
            ASSERT_TRUE(!stem.empty() && name.size() <= 255 && isComplete(name)) << name;
            ASSERT_EQ(name.find_first_of(std::string("/\n\x7f\0", 4)), std::string::npos) << name;
            ASSERT_TRUE(stem[0] != '.' && stem.back() != '.' && stem.back() != ' ') << name;
        }
    }
}

TEST(NamePattern, ReadsBackWhatItWrote) {
    const CNamePattern pattern("%artist%/%album% [%year%]/%track% - %title%");
    std::mt19937 random(8);
    const auto word = [&random] {
        std::string text(1 + random() % 9, ' ');
        for (char& c : text) c = static_cast<char>('a' + random() % 26);
        return text;
    };
    for (int run = 0; run < 200; ++run) {
        const Fields fields{{"artist", word() + " - " + word()},
                            {"album", word() + " [live]"},
                            {"year", std::to_string(1000 + random() % 9000)},
                            {"track", std::to_string(random() % 200)},
                            {"title", word() + ". " + word()}};
        EXPECT_EQ(pattern.match(pattern.expand(fields, ".mp3")), fields);
    }
}
