#include "peru/Bucket.h"
#include "peru/Errors.h"
#include "peru/IFileType.h"

#include <gtest/gtest.h>

namespace {

using namespace peru;

std::string str(const P<IString>& text) {
    return CString::toStdString(text);
}

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

    const P<IFileType> image = manager->getFileType(".PNG");
    EXPECT_EQ(str(image->getExtension()), "png");
    EXPECT_EQ(str(image->getMimeType()->getAsString()), "image/png");
    EXPECT_FALSE(image->getDescription()->isEmpty());
    EXPECT_FALSE(image->getIconName()->isEmpty());
    EXPECT_EQ(str(manager->getFileType("")->getMimeType()->getAsString()), "application/octet-stream");
}

TEST(MimeType, ParsesMajorAndMinor) {
    EXPECT_EQ(str(CMimeType::parse(" Text/HTML ; charset=x/y")->getAsString()), "text/html");
    EXPECT_TRUE(CMimeType::parse("a/b")->equals(make<CMimeType>("A", "B")));
    for (const char* text : {"", "text", "/", "a/", "/b", "a/b/c"})
        EXPECT_THROW(CMimeType::parse(text), CParseError);
}

TEST(PartitionedBucket, DelegatesToItsPartitions) {
    const P<CPartitionedBucket> bucket = make<CPartitionedBucket>();
    const P<IString> own = newString("own"), other = newString("other");
    bucket->setObject("name", own);
    bucket->setObjectOf("part", u"name", other);
    EXPECT_EQ(bucket->getObject(u"name"), own);
    EXPECT_EQ(bucket->getObjectOf("", "name"), own);
    EXPECT_EQ(bucket->getObjectOf("part", "name"), other);
    EXPECT_EQ(bucket->getPartition("part")->getObject("name"), other);
    EXPECT_FALSE(bucket->getObjectOf("none", "name"));
    EXPECT_EQ(bucket->getPartitionKeys().size(), 1u);
    bucket->setObject("name", nullptr);
    EXPECT_FALSE(bucket->hasObject("name"));
}

} // namespace
