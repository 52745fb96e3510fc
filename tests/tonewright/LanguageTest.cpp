#include "Library.h"

#include <gmock/gmock.h>

namespace {

using namespace tests;

class Language : public CLibraryTest {
protected:
    // The message about a text that is no URI.
    std::string getMessage() {
        log->take();
        EXPECT_FALSE(TONEWRIGHT_CreateAudioSourceFromURI(u"http://[", 44100, 2, 2, 0));
        const std::vector<SLine> lines = log->take();
        return lines.empty() ? "" : lines.back().text;
    }
};

} // namespace

TEST_F(Language, ChangesTheMessagesFromTheNextOneOn) {
    if (!std::filesystem::exists(std::filesystem::path(TEST_LIBRARY).parent_path() / "Lang"))
        GTEST_SKIP() << "the build has made no language files";
    const std::string english = getMessage();
    EXPECT_THAT(english, testing::HasSubstr("has an invalid format"));
    TONEWRIGHT_SetLanguageID(u"de-AT");
    EXPECT_THAT(getMessage(), testing::HasSubstr("hat ein ung\u00fcltiges Format"));
    TONEWRIGHT_SetLanguageID(u"xx-nowhere");
    EXPECT_THAT(getMessage(), testing::HasSubstr("hat ein ung\u00fcltiges Format"));
    TONEWRIGHT_SetLanguageID(u"fr-CA");
    EXPECT_THAT(getMessage(), testing::HasSubstr("n\u2019est pas valide"));
    TONEWRIGHT_SetLanguageID(u"en-GB");
    EXPECT_EQ(getMessage(), english);
}
