#include "graphics/Elements.h"
#include "graphics/ImageTool.h"
#include "graphics/images/BitmapCache.h"
#include "graphics/images/ImageCodec.h"
#include "graphics/painting/DocumentRenderer.h"
#include "peru/Errors.h"

#include <gtest/gtest.h>

using namespace graphics;

namespace {

// May only throw CError.
void decode(EBitmapFormat format, const std::string& bytes) {
    try { // the header may be whole: then the pixels are missing
        const auto bitmap = peru::make<CBitmap>(format, bytes);
        if (bitmap->GetWidth() < 1000 && bitmap->GetHeight() < 1000) bitmap->GetPixels();
    } catch (const peru::CError&) {
    }
}

} // namespace

TEST(Bitmap, SurvivesEachFormat) {
    std::mt19937 random(4);
    for (const auto& [format, tolerance] : {std::pair(EBitmapFormat::png, 1),
                                            {EBitmapFormat::jng, 24},
                                            {EBitmapFormat::jpg, 24},
                                            {EBitmapFormat::bmp, 0},
                                            {EBitmapFormat::ico, 8}})
        for (int i = 0; i < 8; ++i) {
            const bool hasAlpha = format == EBitmapFormat::png || format == EBitmapFormat::jng;
            // One colour, since JPEG is not exact, with any alpha.
            std::vector<uint32_t> pixels(33 * 17);
            for (uint32_t& pixel : pixels) {
                const uint32_t alpha = hasAlpha ? random() % 256 : 255;
                pixel =
                    alpha << 24 | (200 * alpha / 255) << 16 | (90 * alpha / 255) << 8 | (30 * alpha / 255);
            }
            const std::string bytes = peru::make<CBitmap>(33, 17, pixels)->Encode(format);
            const auto bitmap = peru::make<CBitmap>(format, bytes);
            ASSERT_EQ(bitmap->GetWidth(), 33);
            ASSERT_EQ(bitmap->GetHeight(), 17);
            EXPECT_EQ(bitmap->HasAlpha(), hasAlpha);
            EXPECT_EQ(bitmap->Encode(format), bytes);
            for (size_t p = 0; p < pixels.size(); ++p) {
                ASSERT_EQ(bitmap->GetPixels()[p] >> 24, pixels[p] >> 24) << getExtension(format);
                for (const int shift : {0, 8, 16})
                    ASSERT_NEAR(static_cast<int>(bitmap->GetPixels()[p] >> shift & 255),
                                static_cast<int>(pixels[p] >> shift & 255), tolerance)
                        << getExtension(format);
            }
        }
}

TEST(Bitmap, RejectsDamagedFiles) {
    std::mt19937 random(5);
    const std::string whole = tests::makeBitmap(random, true)->Encode(EBitmapFormat::png);
    const auto cut = peru::make<CBitmap>(EBitmapFormat::png, whole.substr(0, whole.size() / 2));
    EXPECT_EQ(cut->Encode(EBitmapFormat::png).size(), whole.size() / 2);
    EXPECT_THROW(cut->Encode(EBitmapFormat::jpg), peru::CError); // not a transparent picture
    for (const auto format : {EBitmapFormat::jng, EBitmapFormat::jpg})
        tests::damage(tests::makeBitmap(random, true)->Encode(format),
                      [&](const std::string& damaged) { decode(format, damaged); });
    // A header that announces 65535 x 65535 pixels, and a JNG whose picture has another size than its header.
    std::string png = peru::make<CBitmap>(1, 1, std::vector<uint32_t>{0})->Encode(EBitmapFormat::png);
    png.replace(16, 8, std::string("\0\0\xff\xff\0\0\xff\xff", 8));
    EXPECT_THROW(peru::make<CBitmap>(EBitmapFormat::png, png), peru::CError);
    std::string jng =
        peru::make<CBitmap>(2, 2, std::vector<uint32_t>(4, 0x80808080u))->Encode(EBitmapFormat::jng);
    jng[19] = 3;
    EXPECT_EQ(peru::make<CBitmap>(EBitmapFormat::jng, jng)->GetPixels(), std::vector<uint32_t>(6, 0));
}

TEST(Bitmap, ReadsWhatThePeerWrites) {
    const tests::CTempFolder folder;
    for (const auto& [name, format] : {std::pair("a.tif", EBitmapFormat::tif),
                                       {"a.gif", EBitmapFormat::gif},
                                       {"a.mng", EBitmapFormat::mng},
                                       {"a.png", EBitmapFormat::png},
                                       {"a.bmp", EBitmapFormat::bmp},
                                       {"a.ico", EBitmapFormat::ico}}) {
        tests::runImageTool(folder.path(), std::string("-size 20x10 pattern:checkerboard -colors 4 ") + name);
        const std::string bytes = tests::readFile(folder / name);
        ASSERT_EQ(detectFormat(bytes), format) << name;
        const auto bitmap = peru::make<CBitmap>(format, bytes);
        EXPECT_EQ(bitmap->GetPixels(), tests::readByImageTool(folder.path(), name)) << name;
        EXPECT_FALSE(bitmap->HasAlpha()) << name;
        tests::damage(bytes, [&, kind = format](const std::string& damaged) { decode(kind, damaged); });
        // The limit holds before anything is decoded.
        peru::gui::setMaximalPixels(199);
        EXPECT_THROW(peru::make<CBitmap>(format, bytes), peru::CError) << name;
        peru::gui::setMaximalPixels(0);
    }
}

namespace {

P<CGraphicDocument> makeAlbum(int count, const std::string& png) {
    auto document = peru::make<CGraphicDocument>();
    for (int i = 0; i < count; ++i) {
        auto image = peru::make<CGraphicImage>();
        image->SetBitmap(peru::make<CBitmap>(EBitmapFormat::png, png));
        image->SetSize(10, 10);
        image->SetCenter(10 * i, 0);
        document->Add(image);
    }
    return document;
}

} // namespace

TEST(BitmapCache, HoldsNoMoreThanItsLimit) {
    constexpr int64_t kBytes = 200 * 200 * 4;
    std::vector<uint32_t> pixels(200 * 200, 0xFF336699u);
    const std::string png = peru::make<CBitmap>(200, 200, pixels)->Encode(EBitmapFormat::png);
    peru::gui::setImageMemory(5 * kBytes + 100);
    const int64_t before = getBitmapCache().GetBytes();
    const auto document = makeAlbum(12, png);
    EXPECT_EQ(getBitmapCache().GetBytes(), before); // nothing is decoded

    // Each element has 10 mm, that is 10 pixels here: the versions remain when the large pictures are gone.
    SRenderOptions options;
    options.dpi = 25.4;
    const auto first = RenderBitmap(*document, options);
    EXPECT_LE(getBitmapCache().GetBytes(), 5 * kBytes + 100);
    const auto bitmap = P<CGraphicImage>(document->GetElement(0))->GetBitmap();
    const SPixelSize small{10, 10};
    const auto version = bitmap->GetVersion(small)->GetPixels();
    EXPECT_EQ(version[55], 0xFF336699u);
    EXPECT_EQ(bitmap->GetVersion(small)->GetPixels().GetImage(), version.GetImage());
    EXPECT_EQ(RenderBitmap(*document, options)->GetPixels(), first->GetPixels());

    // Released pixels remain with those who hold them, and are decoded again for others.
    const CPixels held = bitmap->GetPixels();
    for (int i = 1; i < 12; ++i) P<CGraphicImage>(document->GetElement(i))->GetBitmap()->GetPixels();
    EXPECT_LE(getBitmapCache().GetBytes(), 5 * kBytes + 100);
    EXPECT_NE(bitmap->GetPixels().GetImage(), held.GetImage());
    EXPECT_EQ(held, pixels);

    // A change of the element releases the versions, a picture above the limit is not kept, the end of the
    // bitmaps releases everything.
    document->GetElement(0)->SetRotation(30);
    EXPECT_NE(bitmap->GetVersion(small)->GetPixels().GetImage(), version.GetImage());
    peru::gui::setImageMemory(kBytes - 1);
    P<CGraphicImage>(document->GetElement(1))->GetBitmap()->GetPixels();
    EXPECT_LE(getBitmapCache().GetBytes(), kBytes - 1);
    EXPECT_NE(bitmap->GetPixels().GetImage(), bitmap->GetPixels().GetImage());
    peru::gui::setImageMemory(0);
    for (int i = 0; i < 12; ++i) P<CGraphicImage>(document->GetElement(i))->SetBitmap(nullptr);
}
