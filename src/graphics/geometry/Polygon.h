// Closed polygons: the outlines that elements are compared by.
#pragma once

#include "graphics/geometry/Matrix.h"

#include <vector>

namespace graphics {

// The last vertex is joined to the first; repeating the first vertex at the end is allowed.
using Polygon = std::vector<SPoint>;

GRAPHICS_API Polygon makeRectangle(const SRect& rect);
// The vertices lie on the curve, so the polygon is slightly smaller than the shape.
GRAPHICS_API Polygon makeEllipse(const SRect& rect);
// The radius is limited to half of the smaller side.
GRAPHICS_API Polygon makeRoundedRectangle(const SRect& rect, double radius);
GRAPHICS_API Polygon transform(const CMatrix& matrix, Polygon polygon);
// The smallest upright rectangle; empty for a polygon without vertices.
GRAPHICS_API SRect getBounds(const Polygon& polygon);

// By the even-odd rule.
GRAPHICS_API bool contains(const Polygon& polygon, SPoint point);
// True if the outlines touch or cross, or if one polygon lies inside the other.
GRAPHICS_API bool intersect(const Polygon& first, const Polygon& second);
// The same for a filled circle.
GRAPHICS_API bool intersectsCircle(const Polygon& polygon, SPoint center, double radius);

} // namespace graphics
