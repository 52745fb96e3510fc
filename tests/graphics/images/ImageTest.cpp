#include "graphics/Elements.h"
#include "graphics/images/ImageCodec.h"
#include "peru/Errors.h"

#include <gtest/gtest.h>

using namespace graphics;

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
    for (const auto format : {EBitmapFormat::png, EBitmapFormat::jng, EBitmapFormat::jpg, EBitmapFormat::bmp,
                              EBitmapFormat::ico}) {
        const std::string bytes = tests::makeBitmap(random, true)->Encode(format);
        for (size_t length = 0; length < bytes.size(); length += 1 + bytes.size() / 60) {
            try { // the header may be whole: then the pixels are missing
                peru::make<CBitmap>(format, bytes.substr(0, length))->GetPixels();
            } catch (const peru::CError&) {
            }
        }
        for (int i = 0; i < 60; ++i) {
            std::string flipped = bytes;
            flipped[random() % bytes.size()] ^= static_cast<char>(1 << random() % 8);
            try {
                const auto bitmap = peru::make<CBitmap>(format, flipped);
                if (bitmap->GetWidth() < 1000 && bitmap->GetHeight() < 1000) bitmap->GetPixels();
            } catch (const peru::CError&) {
            }
        }
    }
    // A header that announces 65535 x 65535 pixels, and a JNG whose picture has another size than its header.
    std::string png = peru::make<CBitmap>(1, 1, std::vector<uint32_t>{0})->Encode(EBitmapFormat::png);
    png.replace(16, 8, std::string("\0\0\xff\xff\0\0\xff\xff", 8));
    EXPECT_THROW(peru::make<CBitmap>(EBitmapFormat::png, png), peru::CError);
    std::string jng =
        peru::make<CBitmap>(2, 2, std::vector<uint32_t>(4, 0x80808080u))->Encode(EBitmapFormat::jng);
    jng[19] = 3;
    EXPECT_EQ(peru::make<CBitmap>(EBitmapFormat::jng, jng)->GetPixels(), std::vector<uint32_t>(6, 0));
}
