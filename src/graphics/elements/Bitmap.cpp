#include "graphics/elements/Bitmap.h"

#include "peru/Errors.h"

namespace graphics {

CBitmap::CBitmap(int width, int height, std::vector<uint32_t> pixels)
    : m_width(width), m_height(height), m_pixels(std::move(pixels)),
      m_hasAlpha(std::any_of(m_pixels.begin(), m_pixels.end(),
                             [](uint32_t pixel) { return (pixel >> 24) != 255; })) {
    if (width < 1 || height < 1 ||
        m_pixels.size() != static_cast<size_t>(width) * static_cast<size_t>(height))
        throw peru::CInvalidArgError("pixels", "CBitmap");
}

} // namespace graphics
