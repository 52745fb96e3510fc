#include "peru/gui/ImageConversion.h"

#include <gtest/gtest.h>
#include <random>
#include <wx/image.h>

using namespace peru::gui;

namespace {

// Each alpha with each value of a channel; the other channels differ. The count is not a multiple of a
// vector.
std::vector<uint32_t> makeAllPixels() {
    std::vector<uint32_t> pixels = {0x12345678u};
    for (uint32_t alpha = 0; alpha < 256; ++alpha)
        for (uint32_t c = 0; c < 256; ++c)
            pixels.push_back(alpha << 24 | c << 16 | (c * 7 & 255) << 8 | (255 - c));
    return pixels;
}

template <class Channel> uint32_t mapPixel(uint32_t pixel, const Channel& channel) {
    const uint32_t alpha = pixel >> 24;
    return alpha << 24 | channel(pixel >> 16 & 255, alpha) << 16 | channel(pixel >> 8 & 255, alpha) << 8 |
           channel(pixel & 255, alpha);
}

uint32_t premultiplyPlainly(uint32_t pixel) {
    return mapPixel(pixel, [](uint32_t c, uint32_t alpha) { return (c * alpha + 127) / 255; });
}

uint32_t unpremultiplyPlainly(uint32_t pixel) {
    return mapPixel(pixel, [](uint32_t c, uint32_t alpha) {
        return alpha ? std::min((c * 255 + alpha / 2) / alpha, 255u) : 0;
    });
}

} // namespace

TEST(RGBAImage, PremultipliesLikeAPlainModel) {
    const std::vector<uint32_t> pixels = makeAllPixels();
    const int count = static_cast<int>(pixels.size());
    const CPremultipliedImage there = premultiply(CRGBAImage(count, 1, pixels));
    const CRGBAImage back = unpremultiply(CPremultipliedImage(count, 1, pixels));
    for (size_t i = 0; i < pixels.size(); ++i) {
        ASSERT_EQ(there.getPixels()[i], premultiplyPlainly(pixels[i])) << std::hex << pixels[i];
        ASSERT_EQ(back.getPixels()[i], unpremultiplyPlainly(pixels[i])) << std::hex << pixels[i];
    }
    EXPECT_EQ(premultiply(unpremultiply(there)), there);
}

TEST(RGBAImage, PassesThroughToolkitAndCairo) {
    std::mt19937 random(7);
    for (int i = 0; i < 200; ++i) {
        const int width = 1 + static_cast<int>(random() % 40), height = 1 + static_cast<int>(random() % 9);
        const uint32_t opaque = i % 2 ? 0xFF000000u : 0;
        std::vector<uint32_t> pixels(static_cast<size_t>(width * height));
        for (uint32_t& pixel : pixels) pixel = static_cast<uint32_t>(random()) | opaque;
        const CRGBAImage image(width, height, pixels);
        const wxImage copy = toWxImage(image);
        EXPECT_EQ(copy.HasAlpha(), !image.isOpaque());
        EXPECT_EQ(fromWxImage(copy), image);
        const CPremultipliedImage premultiplied = premultipliedFromWxImage(copy);
        EXPECT_EQ(premultiplied, premultiply(image));
        EXPECT_EQ(fromSurface(toSurface(premultiplied).get()), premultiplied);
    }
    // Surfaces without alpha have undefined upper bytes and rows of their own length.
    const Surface plain(cairo_image_surface_create(CAIRO_FORMAT_RGB24, 3, 2), cairo_surface_destroy);
    EXPECT_TRUE(fromSurface(plain.get()).isOpaque());
    wxImage masked(2, 1);
    masked.SetRGB(0, 0, 1, 2, 3);
    masked.SetMaskColour(1, 2, 3);
    EXPECT_EQ(fromWxImage(masked).getPixels(), (std::vector<uint32_t>{0x00010203u, 0xFF000000u}));
}
