// The transform between model space and a device.
#pragma once

#include "graphics/Api.h"
#include "graphics/geometry/Geometry.h"

#include <array>
#include <optional>

namespace graphics {

// A 3 by 3 matrix whose last row is 0 0 1. It maps (x, y) to (xx * x + xy * y + x0, yx * x + yy * y + y0).
class GRAPHICS_API CMatrix {
public:
    CMatrix() = default; // identity
    CMatrix(double xx, double yx, double xy, double yy, double x0, double y0)
        : xx(xx), yx(yx), xy(xy), yy(yy), x0(x0), y0(y0) {}

    static CMatrix translation(double x, double y) { return {1, 0, 0, 1, x, y}; }
    static CMatrix scaling(double x, double y) { return {x, 0, 0, y, 0, 0}; }
    // Clockwise, since y points down. Multiples of 90 degrees are exact.
    static CMatrix rotation(double degrees);

    // The right operand is applied first.
    CMatrix operator*(const CMatrix& first) const;

    SPoint apply(SPoint point) const {
        return {xx * point.x + xy * point.y + x0, yx * point.x + yy * point.y + y0};
    }
    // For differences of points: without the translation.
    SPoint applyToVector(SPoint vector) const {
        return {xx * vector.x + xy * vector.y, yx * vector.x + yy * vector.y};
    }
    // Top left, top right, bottom right, bottom left.
    std::array<SPoint, 4> getCorners(const SRect& rect) const;
    // The smallest upright rectangle around the mapped one.
    SRect getBounds(const SRect& rect) const;

    double getDeterminant() const { return xx * yy - xy * yx; }
    // The side of a square with the area of the mapped unit square: the scale of line widths.
    double getMeanScale() const;
    // Empty if the matrix maps the plane to a line or a point.
    std::optional<CMatrix> getInverse() const;

    bool operator==(const CMatrix&) const = default;

    double xx = 1, yx = 0, xy = 0, yy = 1, x0 = 0, y0 = 0;
};

// Exact for multiples of 90 degrees.
struct SSineCosine {
    double sine;
    double cosine;
};
GRAPHICS_API SSineCosine getSineCosine(double degrees);

} // namespace graphics
