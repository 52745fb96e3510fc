#include "graphics/painting/OffScreen.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

namespace graphics {

COffScreen::COffScreen(int64_t width, int64_t height)
    : m_width(static_cast<int>(width)), m_height(static_cast<int>(height)) {
    // The sides first, so that their product cannot overflow; cairo's own limit is 32767.
    if (width < 1 || height < 1 || width > 32767 || height > 32767 || width * height > kMaximalPixels)
        throw peru::CError(peru::localize(
            "graphics.COffScreen.TooLarge", "A picture of %WIDTH% x %HEIGHT% pixels is not possible.",
            {{"%WIDTH%", peru::format("%d", width)}, {"%HEIGHT%", peru::format("%d", height)}}));
    m_surface = cairo_image_surface_create(CAIRO_FORMAT_ARGB32, m_width, m_height);
    m_cairo = cairo_create(m_surface);
    const cairo_status_t status = cairo_status(m_cairo);
    if (status == CAIRO_STATUS_SUCCESS) {
        m_graphics = peru::make<TEffectGraphicsContext<CCairoContext>>(m_cairo);
        return;
    }
    cairo_destroy(m_cairo);
    cairo_surface_destroy(m_surface);
    throw peru::CError(cairo_status_to_string(status));
}

COffScreen::~COffScreen() {
    m_graphics.reset();
    cairo_destroy(m_cairo);
    cairo_surface_destroy(m_surface);
}

void COffScreen::checkPainting() const {
    const cairo_status_t status = cairo_status(m_cairo);
    if (status != CAIRO_STATUS_SUCCESS) throw peru::CError(cairo_status_to_string(status));
}

uint32_t* COffScreen::GetRow(int y) {
    cairo_surface_flush(m_surface);
    // For callers that write to the row; costs nothing for an image.
    cairo_surface_mark_dirty(m_surface);
    return reinterpret_cast<uint32_t*>(cairo_image_surface_get_data(m_surface) +
                                       static_cast<ptrdiff_t>(y) * cairo_image_surface_get_stride(m_surface));
}

P<CBitmap> COffScreen::GetBitmap() {
    checkPainting();
    std::vector<uint32_t> pixels;
    pixels.reserve(static_cast<size_t>(m_width) * static_cast<size_t>(m_height));
    for (int y = 0; y < m_height; ++y) pixels.insert(pixels.end(), GetRow(y), GetRow(y) + m_width);
    return peru::make<CBitmap>(m_width, m_height, std::move(pixels));
}

std::string COffScreen::GetPng() {
    checkPainting();
    std::string png;
    const auto append = [](void* target, const unsigned char* data, unsigned length) {
        static_cast<std::string*>(target)->append(reinterpret_cast<const char*>(data), length);
        return CAIRO_STATUS_SUCCESS;
    };
    const cairo_status_t status = cairo_surface_write_to_png_stream(m_surface, append, &png);
    if (status != CAIRO_STATUS_SUCCESS) throw peru::CError(cairo_status_to_string(status));
    return png;
}

} // namespace graphics
