#include "peru/Errors.h"
#include "peru/files/IFileType.h"
#include "support/Files.h"

namespace {

using namespace peru;
using tests::text;

TEST(FileTypes, SortsExtensionsIntoCategories) {
    const P<IFileTypesManager> manager = getFileTypesManager();
    const std::tuple<const char*, EFileCategory, const char*> cases[] = {
        {"jpg", EFileCategory::image, "Image files"},
        {".PNG", EFileCategory::image, "Image files"},
        {"mp3", EFileCategory::audio, "Audio files"},
        {"wav", EFileCategory::audio, "Audio files"},
        {"avi", EFileCategory::video, "Video files"},
        {"txt", EFileCategory::text, "Text files"},
        {"zip", EFileCategory::compressed, "Compressed files"},
        {"so", EFileCategory::system, "System files"},
        {"", EFileCategory::unknown, ""},
        {"no-such-kind", EFileCategory::unknown, ""}};
    for (const auto& [extension, category, name] : cases) {
        EXPECT_EQ(manager->getFileType(extension)->getCategory(), category) << extension;
        EXPECT_EQ(text(manager->getCategoryName(category)), name);
    }

    EXPECT_EQ(text(manager->getFileType(".PNG")->getMimeType()->getAsString()), "image/png");
    EXPECT_EQ(text(manager->getFileType(".PNG")->getExtension()), "png");
    EXPECT_EQ(text(manager->getFileType(".PNG")->getIconName()), "image-png");
    EXPECT_FALSE(manager->getFileType(".PNG")->getDescription()->isEmpty());
    EXPECT_EQ(text(manager->getFileType("")->getMimeType()->getAsString()), "application/octet-stream");
}

TEST(MimeType, ParsesMajorAndMinor) {
    EXPECT_EQ(text(CMimeType::parse(" Text/HTML ; charset=x/y")->getAsString()), "text/html");
    EXPECT_TRUE(CMimeType::parse("a/b")->equals(make<CMimeType>("A", "B")));
    for (const char* bad : {"", "text", "/", "a/", "/b", "a/b/c"})
        EXPECT_THROW(CMimeType::parse(bad), CParseError);
}

} // namespace
