#include "peru/gui/RGBAImage.h"

#include "peru/Errors.h"

#include <utility>

namespace peru::gui {

namespace {

size_t countPixels(int width, int height) {
    if (width < 1 || height < 1) throw CInvalidArgError("size", "TRGBAImage");
    return static_cast<size_t>(width) * static_cast<size_t>(height);
}

// The image with each pixel replaced, in the same memory.
template <EAlpha kTo, EAlpha kFrom, class Map>
TRGBAImage<kTo> mapPixels(TRGBAImage<kFrom> image, const Map& map) {
    if (image.isEmpty()) return {};
    const int width = image.getWidth(), height = image.getHeight();
    uint32_t* const pixels = image.getRow(0);
    const size_t count = image.getPixels().size();
    for (size_t i = 0; i < count; ++i) pixels[i] = map(pixels[i]);
    return {width, height, std::move(image).takePixels()};
}

} // namespace

template <EAlpha kAlpha> TRGBAImage<kAlpha>::TRGBAImage(int width, int height)
    : m_width(width), m_height(height), m_pixels(countPixels(width, height)) {}

template <EAlpha kAlpha> TRGBAImage<kAlpha>::TRGBAImage(int width, int height, std::vector<uint32_t> pixels)
    : m_width(width), m_height(height), m_pixels(std::move(pixels)) {
    if (m_pixels.size() != countPixels(width, height)) throw CInvalidArgError("pixels", "TRGBAImage");
}

template <EAlpha kAlpha> std::vector<uint32_t> TRGBAImage<kAlpha>::takePixels() && {
    m_width = m_height = 0;
    return std::exchange(m_pixels, {});
}

template <EAlpha kAlpha> bool TRGBAImage<kAlpha>::isOpaque() const {
    // In blocks: the loop over a block has no exit, so that the compiler vectorises it.
    constexpr size_t kBlock = 4096;
    for (size_t begin = 0; begin < m_pixels.size(); begin += kBlock) {
        const size_t end = std::min(begin + kBlock, m_pixels.size());
        uint32_t all = 0xFF000000u;
        for (size_t i = begin; i < end; ++i) all &= m_pixels[i];
        if (all != 0xFF000000u) return false;
    }
    return true;
}

template class TRGBAImage<EAlpha::straight>;
template class TRGBAImage<EAlpha::premultiplied>;

CPremultipliedImage premultiply(CRGBAImage image) {
    return mapPixels<EAlpha::premultiplied>(std::move(image), [](uint32_t pixel) {
        const uint32_t alpha = pixel >> 24;
        // With t = channel * alpha + 128, (t + t / 256) / 256 is the rounded quotient by 255. Red and blue
        // share a word.
        uint32_t redBlue = (pixel & 0xFF00FF) * alpha + 0x800080;
        redBlue = (redBlue + (redBlue >> 8 & 0xFF00FF)) >> 8 & 0xFF00FF;
        uint32_t green = (pixel >> 8 & 0xFF) * alpha + 0x80;
        green = (green + (green >> 8)) & 0xFF00;
        return alpha << 24 | redBlue | green;
    });
}

CRGBAImage unpremultiply(CPremultipliedImage image) {
    return mapPixels<EAlpha::straight>(std::move(image), [](uint32_t pixel) {
        const uint32_t alpha = pixel >> 24;
        const float divisor = static_cast<float>(static_cast<int32_t>(alpha > 0 ? alpha : 1));
        const uint32_t mask = alpha > 0 ? 0xFFFFFFFFu : 0;
        // Numerators are below 2^16, so the quotient of floats never reaches the next whole number early.
        const auto divide = [&](uint32_t channel) {
            const auto numerator = static_cast<float>(static_cast<int32_t>(channel * 255 + alpha / 2));
            const auto quotient = static_cast<uint32_t>(static_cast<int32_t>(numerator / divisor));
            return quotient < 255 ? quotient : 255;
        };
        const uint32_t colour =
            divide(pixel >> 16 & 0xFF) << 16 | divide(pixel >> 8 & 0xFF) << 8 | divide(pixel & 0xFF);
        return alpha << 24 | (colour & mask);
    });
}

} // namespace peru::gui
