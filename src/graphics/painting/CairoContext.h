// Painting with cairo.
#pragma once

#include "graphics/painting/TEffectGraphicsContext.h"

#include <cairo.h>

namespace graphics {

// Paints on any cairo context. The same calls give the same shapes on bitmaps, PDF and SVG.
class GRAPHICS_API CCairoContext : public peru::CObject, public IGraphicsContext {
public:
    // Takes a reference to the context. `resolution`: see GetResolution().
    explicit CCairoContext(cairo_t* cairo, double resolution = 1);
    ~CCairoContext() override;
    CCairoContext(const CCairoContext&) = delete;
    CCairoContext& operator=(const CCairoContext&) = delete;

    void SetMatrix(const CMatrix& matrix) override;
    void DrawPath(const CPath& path, const SFill* fill, const SPen* pen) override;
    void DrawBitmap(const CBitmap& bitmap, const SRect& source, const SRect& target) override;
    void DrawLayout(const CTextLayout& layout, SPoint origin) override;
    void PushClip(const SRect& rect) override;
    void PopClip() override;
    SRect GetClipBox() const override;
    double GetResolution() const override { return m_resolution; }

private:
    void addPath(const CPath& path);
    // The path is the current one, before and after the call.
    void fillPath(const CPath& path, const SBrush& brush);

    cairo_t* const m_cairo;
    const double m_resolution;
    CMatrix m_matrix;
};

} // namespace graphics
