#include "graphics/painting/CairoContext.h"

#include "graphics/painting/CairoBitmap.h"
#include "graphics/painting/Hatch.h"
#include "graphics/text/PangoLayouts.h"

#include <cmath>
#include <memory>

namespace graphics {

namespace {

using Pattern = std::unique_ptr<cairo_pattern_t, decltype(&cairo_pattern_destroy)>;

void setColour(cairo_t* cairo, const SColour& colour) {
    cairo_set_source_rgba(cairo, colour.red / 255.0, colour.green / 255.0, colour.blue / 255.0,
                          colour.alpha / 255.0);
}

void addStop(cairo_pattern_t* pattern, double offset, const SColour& colour) {
    cairo_pattern_add_color_stop_rgba(pattern, offset, colour.red / 255.0, colour.green / 255.0,
                                      colour.blue / 255.0, colour.alpha / 255.0);
}

void setDashes(cairo_t* cairo, const SPen& pen) {
    const double w = pen.width;
    const double dot[] = {w, 2 * w}, longDash[] = {6 * w, 3 * w}, shortDash[] = {3 * w, 3 * w},
                 dotDash[] = {3 * w, 3 * w, w, 3 * w};
    switch (pen.style) {
    case kStyleDot:
        return cairo_set_dash(cairo, dot, 2, 0);
    case kStyleLongDash:
        return cairo_set_dash(cairo, longDash, 2, 0);
    case kStyleShortDash:
        return cairo_set_dash(cairo, shortDash, 2, 0);
    case kStyleDotDash:
        return cairo_set_dash(cairo, dotDash, 4, 0);
    default:
        return cairo_set_dash(cairo, nullptr, 0, 0);
    }
}

} // namespace

CCairoContext::CCairoContext(cairo_t* cairo, double resolution)
    : m_cairo(cairo_reference(cairo)), m_resolution(resolution) {}

CCairoContext::~CCairoContext() {
    cairo_destroy(m_cairo);
}

void CCairoContext::SetMatrix(const CMatrix& matrix) {
    m_matrix = matrix;
}

void CCairoContext::addPath(const CPath& path) {
    cairo_new_path(m_cairo);
    for (const CPath::SSegment& segment : path.GetSegments()) switch (segment.verb) {
        case CPath::EVerb::move:
            cairo_move_to(m_cairo, segment.end.x, segment.end.y);
            break;
        case CPath::EVerb::line:
            cairo_line_to(m_cairo, segment.end.x, segment.end.y);
            break;
        case CPath::EVerb::curve:
            cairo_curve_to(m_cairo, segment.control1.x, segment.control1.y, segment.control2.x,
                           segment.control2.y, segment.end.x, segment.end.y);
            break;
        case CPath::EVerb::close:
            cairo_close_path(m_cairo);
            break;
        }
}

void CCairoContext::fillPath(const CPath& path, const SBrush& brush) {
    setColour(m_cairo, brush.colour);
    if (!isHatch(brush.style)) return cairo_fill_preserve(m_cairo);
    cairo_save(m_cairo);
    cairo_clip(m_cairo);
    paintHatch(m_cairo, brush.style);
    cairo_restore(m_cairo);
    addPath(path); // for the outline
}

void CCairoContext::DrawPath(const CPath& path, const SFill* fill, const SPen* pen) {
    // A matrix without an inverse would put the cairo context into an error state for good.
    if (path.IsEmpty() || !m_matrix.getInverse()) return;
    const bool hasGradient = fill && fill->gradient.isVisible();
    const bool hasFill = hasGradient || (fill && fill->brush.isVisible());
    const bool hasLine = pen && pen->isVisible();
    if (!hasFill && !hasLine) return;
    cairo_save(m_cairo);
    const cairo_matrix_t matrix{m_matrix.xx, m_matrix.yx, m_matrix.xy, m_matrix.yy, m_matrix.x0, m_matrix.y0};
    cairo_transform(m_cairo, &matrix);
    addPath(path);
    if (hasGradient) {
        const SRect& box = fill->gradientBox;
        const Pattern pattern(cairo_pattern_create_linear(0, box.top, 0, box.getBottom()),
                              cairo_pattern_destroy);
        addStop(pattern.get(), 0, fill->gradient.start);
        addStop(pattern.get(), 1, fill->gradient.end);
        cairo_set_source(m_cairo, pattern.get());
        cairo_fill_preserve(m_cairo);
    } else if (hasFill) {
        fillPath(path, fill->brush);
    }
    if (hasLine) {
        setColour(m_cairo, pen->colour);
        cairo_set_line_width(m_cairo, pen->width);
        setDashes(m_cairo, *pen);
        cairo_stroke_preserve(m_cairo);
    }
    cairo_new_path(m_cairo);
    cairo_restore(m_cairo);
}

void CCairoContext::DrawBitmap(const CBitmap& bitmap, const SRect& source, const SRect& target) {
    if (!m_matrix.getInverse()) return;
    cairo_save(m_cairo);
    const cairo_matrix_t matrix{m_matrix.xx, m_matrix.yx, m_matrix.xy, m_matrix.yy, m_matrix.x0, m_matrix.y0};
    cairo_transform(m_cairo, &matrix);
    paintBitmap(m_cairo, bitmap, source, target);
    cairo_restore(m_cairo);
}

void CCairoContext::DrawLayout(const CTextLayout& layout, SPoint origin) {
    if (!m_matrix.getInverse()) return;
    cairo_save(m_cairo);
    const cairo_matrix_t matrix{m_matrix.xx, m_matrix.yx, m_matrix.xy, m_matrix.yy, m_matrix.x0, m_matrix.y0};
    cairo_transform(m_cairo, &matrix);
    cairo_translate(m_cairo, origin.x, origin.y);
    cairo_scale(m_cairo, 1 / kUnitsPerMillimetre, 1 / kUnitsPerMillimetre);
    for (const auto& block : layout.GetImpl().blocks) {
        cairo_move_to(m_cairo, block.left, block.top);
        pango_cairo_show_layout(m_cairo, block.layout.get());
    }
    cairo_restore(m_cairo);
}

void CCairoContext::PushClip(const SRect& rect) {
    cairo_save(m_cairo);
    const auto corners = m_matrix.getCorners(rect);
    cairo_new_path(m_cairo);
    for (const SPoint& corner : corners) cairo_line_to(m_cairo, corner.x, corner.y);
    cairo_close_path(m_cairo);
    cairo_clip(m_cairo);
}

void CCairoContext::PopClip() {
    cairo_restore(m_cairo);
}

SRect CCairoContext::GetClipBox() const {
    double left = 0, top = 0, right = 0, bottom = 0;
    cairo_clip_extents(m_cairo, &left, &top, &right, &bottom);
    return SRect::fromEdges(left, top, right, bottom);
}

} // namespace graphics
