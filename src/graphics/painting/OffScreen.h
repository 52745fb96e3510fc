// A bitmap that is painted on, without a display.
#pragma once

#include "graphics/painting/CairoContext.h"

namespace graphics {

// Transparent at first. Throws CError if the size is above the limit or memory is short.
class GRAPHICS_API COffScreen {
public:
    COffScreen(int64_t width, int64_t height);
    ~COffScreen();
    COffScreen(const COffScreen&) = delete;
    COffScreen& operator=(const COffScreen&) = delete;

    IGraphicsContext& GetGraphics() const { return *m_graphics; }
    int GetWidth() const { return m_width; }
    int GetHeight() const { return m_height; }
    // The pixels of a row, premultiplied ARGB. Valid until the next painting.
    uint32_t* GetRow(int y);
    // A copy of the pixels, or a PNG file. Both throw CError, also if an earlier painting failed.
    P<CBitmap> GetBitmap();
    std::string GetPng();

private:
    void checkPainting() const;

    int m_width;
    int m_height;
    cairo_surface_t* m_surface = nullptr;
    cairo_t* m_cairo = nullptr;
    P<IGraphicsContext> m_graphics;
};

} // namespace graphics
