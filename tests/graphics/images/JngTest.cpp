#include "graphics/ImageTool.h"
#include "graphics/images/WxImages.h"
#include "peru/gui/ImageConversion.h"
#include "wxjng/Handlers.h"

#include <wx/mstream.h>

using namespace graphics;
using peru::gui::fromWxImage;

namespace {

// Smooth, as JPEG likes it, with all values of alpha, and colours under transparent pixels.
wxImage makePicture(bool isGrey, bool hasAlpha) {
    wxImage image(64, 48);
    if (hasAlpha) image.SetAlpha();
    for (int y = 0; y < 48; ++y)
        for (int x = 0; x < 64; ++x) {
            const auto grey = static_cast<uint8_t>(40 + 3 * x);
            const auto other = static_cast<uint8_t>(isGrey ? grey : 220 - 4 * y);
            image.SetRGB(x, y, grey, other, isGrey ? grey : 60);
            if (hasAlpha) image.SetAlpha(x, y, static_cast<uint8_t>(x < 16 ? 0 : std::min(255, 5 * y + x)));
        }
    return image;
}

} // namespace

TEST(Jng, IsReadAsItWasWrittenByBothSides) {
    const tests::CTempFolder folder;
    int number = 0;
    for (const bool isGrey : {false, true})
        for (const int compression : {-1, 0, 8}) {
            SCOPED_TRACE(std::to_string(isGrey) + " " + std::to_string(compression));
            wxImage image = makePicture(isGrey, compression >= 0);
            const auto original = fromWxImage(image).getPixels();
            image.SetOption(wxjng::kOptionAlphaCompression, std::max(compression, 0));
            const std::string bytes = writeImage(EBitmapFormat::jng, image);
            const std::string name = std::to_string(number++) + ".jng";
            folder.write(name, bytes);
            // Alpha without loss; colours also where they are transparent.
            const auto ours = fromWxImage(readImage(EBitmapFormat::jng, bytes)).getPixels();
            EXPECT_LE(tests::compare(ours, original, true), 12);
            for (size_t i = 0; compression == 0 && i < ours.size(); ++i)
                ASSERT_EQ(ours[i] >> 24, original[i] >> 24);
            // The other program's decoder of colours may differ by a rounding.
            EXPECT_LE(tests::compare(tests::readByImageTool(folder.path(), name), ours), 3);
            const uint8_t type = static_cast<uint8_t>(bytes[24]);
            EXPECT_EQ(type, (isGrey ? 8 : 10) + (compression < 0 ? 0 : 4));
        }
    // Written by the other program: its alpha is a PNG or, with a quality, a JPEG picture.
    for (const char* const options :
         {"0.jng -quality 90", "1.jng", "1.jng -quality 60", "3.jng", "4.jng -quality 50"}) {
        tests::runImageTool(folder.path(), std::string(options) + " their.jng");
        const auto theirs = tests::readFile(folder.path() / "their.jng");
        EXPECT_LE(tests::compare(fromWxImage(readImage(EBitmapFormat::jng, theirs)).getPixels(),
                                 tests::readByImageTool(folder.path(), "their.jng")),
                  3)
            << options;
    }
}

TEST(Jng, HandlersServeTheToolkit) {
    registerImageHandlers();
    registerImageHandlers();
    for (const auto& [type, extension] : {std::pair(wxjng::kJngType, "jng"), {wxjng::kMngType, "mng"}}) {
        const tests::CTempFolder folder;
        const wxString path = wxString::FromUTF8((folder.path() / "a.").string()) + extension;
        ASSERT_TRUE(makePicture(false, true).SaveFile(path));
        wxImage copy;
        ASSERT_TRUE(copy.LoadFile(path)) << extension; // by the content
        EXPECT_EQ(static_cast<int>(copy.GetType()), type);
        EXPECT_TRUE(copy.HasAlpha());
        EXPECT_EQ(wxImage::GetImageCount(path), 1);
    }
}
