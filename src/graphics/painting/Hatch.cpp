#include "graphics/painting/Hatch.h"

#include "graphics/elements/Appearance.h"

#include <cmath>
#include <utility>

namespace graphics {

namespace {

constexpr double kDistance = 2; // of the lines, in millimetres
constexpr double kLineWidth = 0.25;
constexpr double kMaximalLines = 5000; // more are below what a device shows

// Adds the lines of one direction: those on which x * normalX + y * normalY is a multiple of the distance.
void addLines(cairo_t* cairo, double normalX, double normalY) {
    double left = 0, top = 0, right = 0, bottom = 0;
    cairo_clip_extents(cairo, &left, &top, &right, &bottom);
    const double centerX = (left + right) * 0.5, centerY = (top + bottom) * 0.5;
    const double reach = std::hypot(right - left, bottom - top) * 0.5;
    const double middle = centerX * normalX + centerY * normalY;
    const double first = std::ceil((middle - reach) / kDistance),
                 last = std::floor((middle + reach) / kDistance);
    if (!(last - first <= kMaximalLines)) {
        cairo_rectangle(cairo, left, top, right - left, bottom - top);
        cairo_fill(cairo);
        return;
    }
    for (double index = first; index <= last; ++index) {
        const double offset = index * kDistance - middle;
        const double x = centerX + offset * normalX, y = centerY + offset * normalY;
        cairo_move_to(cairo, x - reach * normalY, y + reach * normalX);
        cairo_line_to(cairo, x + reach * normalY, y - reach * normalX);
    }
}

} // namespace

bool isHatch(int brushStyle) {
    return brushStyle >= kStyleBackwardDiagonal && brushStyle <= kStyleVertical;
}

void paintHatch(cairo_t* cairo, int brushStyle) {
    const double diagonal = std::sqrt(0.5);
    cairo_new_path(cairo);
    if (brushStyle == kStyleBackwardDiagonal || brushStyle == kStyleCrossDiagonal)
        addLines(cairo, diagonal, diagonal);
    if (brushStyle == kStyleForwardDiagonal || brushStyle == kStyleCrossDiagonal)
        addLines(cairo, diagonal, -diagonal);
    if (brushStyle == kStyleHorizontal || brushStyle == kStyleCross) addLines(cairo, 0, 1);
    if (brushStyle == kStyleVertical || brushStyle == kStyleCross) addLines(cairo, 1, 0);
    cairo_set_line_width(cairo, kLineWidth);
    cairo_set_dash(cairo, nullptr, 0, 0);
    cairo_set_line_cap(cairo, CAIRO_LINE_CAP_BUTT);
    cairo_stroke(cairo);
}

} // namespace graphics
