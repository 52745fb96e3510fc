// Pixels of an image.
#pragma once

#include "graphics/Api.h"
#include "peru/Object.h"

#include <cstdint>
#include <vector>

namespace graphics {

using peru::P;

// Premultiplied ARGB, 32 bits for each pixel, row by row from the top. Immutable, so elements share it.
class GRAPHICS_API CBitmap : public peru::CObject {
public:
    // Throws CInvalidArgError if the number of pixels does not fit the size.
    CBitmap(int width, int height, std::vector<uint32_t> pixels);
    ~CBitmap() override = default;

    int GetWidth() const { return m_width; }
    int GetHeight() const { return m_height; }
    const std::vector<uint32_t>& GetPixels() const { return m_pixels; }
    // True if a pixel is not opaque.
    bool HasAlpha() const { return m_hasAlpha; }

private:
    const int m_width;
    const int m_height;
    const std::vector<uint32_t> m_pixels;
    const bool m_hasAlpha;
};

} // namespace graphics
