#include "graphics/images/Bitmap.h"

#include "graphics/images/ImageCodec.h"
#include "peru/Errors.h"
#include "peru/log/LogManager.h"

namespace graphics {

CBitmap::CBitmap(int width, int height, std::vector<uint32_t> pixels)
    : m_width(width), m_height(height), m_pixels(std::move(pixels)) {
    if (width < 1 || height < 1 ||
        m_pixels.size() != static_cast<size_t>(width) * static_cast<size_t>(height))
        throw peru::CInvalidArgError("pixels", "CBitmap");
}

CBitmap::CBitmap(EBitmapFormat format, std::string bytes) : m_format(format), m_bytes(std::move(bytes)) {
    const SPixelSize size = probeImage(format, m_bytes);
    m_width = size.width;
    m_height = size.height;
}

const std::vector<uint32_t>& CBitmap::GetPixels() const {
    if (!m_pixels.empty()) return m_pixels;
    try {
        m_pixels = decodeImage(m_format, m_bytes, {m_width, m_height});
    } catch (const peru::CException& error) {
        peru::getLogManager()->warning(peru::CString::fromUTF8("graphics"), error.getDescription());
        m_pixels.assign(static_cast<size_t>(m_width) * static_cast<size_t>(m_height), 0);
    }
    return m_pixels;
}

bool CBitmap::HasAlpha() const {
    if (m_format == EBitmapFormat::jpg) return false;
    if (m_format == EBitmapFormat::jng) return true;
    const auto& pixels = GetPixels();
    return std::any_of(pixels.begin(), pixels.end(), [](uint32_t pixel) { return (pixel >> 24) != 255; });
}

std::string CBitmap::Encode(EBitmapFormat format) const {
    if (format == m_format) return m_bytes;
    return encodeImage(format, GetPixels(), {m_width, m_height});
}

} // namespace graphics
