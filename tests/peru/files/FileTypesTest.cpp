#include "peru/Errors.h"
#include "peru/files/IFileType.h"
#include "support/Files.h"

namespace {

using namespace peru;
using tests::text;

TEST(FileTypes, SortsExtensionsIntoCategories) {
    struct SCase {
        const char* extension;
        EFileCategory category;
    };
    const P<IFileTypesManager> manager = getFileTypesManager();
    for (const SCase& c : {SCase{"jpg", EFileCategory::image}, SCase{".PNG", EFileCategory::image},
                           SCase{"mp3", EFileCategory::audio}, SCase{"wav", EFileCategory::audio},
                           SCase{"avi", EFileCategory::video}, SCase{"txt", EFileCategory::text},
                           SCase{"zip", EFileCategory::compressed}, SCase{"so", EFileCategory::system},
                           SCase{"", EFileCategory::unknown}, SCase{"no-such-kind", EFileCategory::unknown}})
        EXPECT_EQ(manager->getFileType(c.extension)->getCategory(), c.category) << c.extension;

    EXPECT_EQ(text(manager->getFileType(".PNG")->getMimeType()->getAsString()), "image/png");
    EXPECT_EQ(text(manager->getFileType("")->getMimeType()->getAsString()), "application/octet-stream");
}

TEST(MimeType, ParsesMajorAndMinor) {
    EXPECT_EQ(text(CMimeType::parse(" Text/HTML ; charset=x/y")->getAsString()), "text/html");
    EXPECT_TRUE(CMimeType::parse("a/b")->equals(make<CMimeType>("A", "B")));
    for (const char* bad : {"", "text", "/", "a/", "/b", "a/b/c"})
        EXPECT_THROW(CMimeType::parse(bad), CParseError);
}

} // namespace
