// Pictures in memory.
#pragma once

#include "graphics/Api.h"

#include <cstddef>
#include <cstdint>
#include <vector>

namespace peru::gui {

enum class EAlpha {
    straight,      // colours are independent of the alpha, as in files
    premultiplied, // colours are multiplied by the alpha, as cairo paints them
};

// 32 bits for each pixel, 0xAARRGGBB, row by row from the top without padding. The two kinds of alpha are
// different types, so that pixels of one kind are never painted or written as the other.
template <EAlpha kAlpha> class TRGBAImage {
public:
    TRGBAImage() = default; // without pixels
    // Transparent. Throws CInvalidArgError if a side is below 1.
    TRGBAImage(int width, int height);
    // Throws CInvalidArgError if the number of pixels does not fit the size.
    TRGBAImage(int width, int height, std::vector<uint32_t> pixels);

    int getWidth() const { return m_width; }
    int getHeight() const { return m_height; }
    bool isEmpty() const { return m_pixels.empty(); }
    const std::vector<uint32_t>& getPixels() const { return m_pixels; }
    // Leaves the image without pixels.
    std::vector<uint32_t> takePixels() &&;
    uint32_t* getRow(int y) { return m_pixels.data() + getOffset(y); }
    const uint32_t* getRow(int y) const { return m_pixels.data() + getOffset(y); }
    bool isOpaque() const;
    bool operator==(const TRGBAImage&) const = default;

private:
    size_t getOffset(int y) const { return static_cast<size_t>(y) * static_cast<size_t>(m_width); }

    int m_width = 0;
    int m_height = 0;
    std::vector<uint32_t> m_pixels;
};

using CRGBAImage = TRGBAImage<EAlpha::straight>;
using CPremultipliedImage = TRGBAImage<EAlpha::premultiplied>;

// Each channel becomes channel * alpha / 255, rounded to the nearest value. Both conversions reuse the memory
// of an argument that is moved.
GRAPHICS_API CPremultipliedImage premultiply(CRGBAImage image);
// Each channel becomes min(channel * 255 / alpha, 255), rounded; 0 without alpha. premultiply() restores the
// pixels, unless a channel was above its alpha.
GRAPHICS_API CRGBAImage unpremultiply(CPremultipliedImage image);

extern template class GRAPHICS_API TRGBAImage<EAlpha::straight>;
extern template class GRAPHICS_API TRGBAImage<EAlpha::premultiplied>;

} // namespace peru::gui
