#include "graphics/geometry/Polygon.h"

#include <cmath>
#include <numbers>

namespace graphics {

namespace {

constexpr int kQuarterSteps = 16;

// Appends the arc of a quarter turn that begins at `quarter` times 90 degrees.
void addQuarter(Polygon& polygon, SPoint center, SSize radii, int quarter) {
    for (int step = 0; step <= kQuarterSteps; ++step) {
        const auto [sine, cosine] =
            getSineCosine(90.0 * (quarter + static_cast<double>(step) / kQuarterSteps));
        polygon.push_back({center.x + radii.width * cosine, center.y + radii.height * sine});
    }
}

// Positive if c lies to one side of the line from a to b, negative on the other side.
double getSide(SPoint a, SPoint b, SPoint c) {
    return (b.x - a.x) * (c.y - a.y) - (b.y - a.y) * (c.x - a.x);
}

bool isInBox(SPoint a, SPoint b, SPoint c) {
    return c.x >= std::min(a.x, b.x) && c.x <= std::max(a.x, b.x) && c.y >= std::min(a.y, b.y) &&
           c.y <= std::max(a.y, b.y);
}

bool doSegmentsMeet(SPoint a, SPoint b, SPoint c, SPoint d) {
    const double abc = getSide(a, b, c), abd = getSide(a, b, d);
    const double cda = getSide(c, d, a), cdb = getSide(c, d, b);
    if (((abc > 0) != (abd > 0)) && ((cda > 0) != (cdb > 0)) && abc != 0 && abd != 0 && cda != 0 && cdb != 0)
        return true;
    return (abc == 0 && isInBox(a, b, c)) || (abd == 0 && isInBox(a, b, d)) ||
           (cda == 0 && isInBox(c, d, a)) || (cdb == 0 && isInBox(c, d, b));
}

double getSquaredDistance(SPoint a, SPoint b, SPoint point) {
    const SPoint edge{b.x - a.x, b.y - a.y};
    const double length = edge.x * edge.x + edge.y * edge.y;
    double along = 0;
    if (length > 0)
        along = std::clamp(((point.x - a.x) * edge.x + (point.y - a.y) * edge.y) / length, 0.0, 1.0);
    const double x = a.x + along * edge.x - point.x;
    const double y = a.y + along * edge.y - point.y;
    return x * x + y * y;
}

// Calls check(a, b) for each edge until one returns true.
template <class Check> bool anyEdge(const Polygon& polygon, const Check& check) {
    for (size_t i = 0; i < polygon.size(); ++i)
        if (check(polygon[i], polygon[(i + 1) % polygon.size()])) return true;
    return false;
}

} // namespace

Polygon makeRectangle(const SRect& rect) {
    const auto corners = CMatrix().getCorners(rect);
    return {corners.begin(), corners.end()};
}

Polygon makeEllipse(const SRect& rect) {
    Polygon polygon;
    for (int quarter = 0; quarter < 4; ++quarter)
        addQuarter(polygon, rect.getCenter(), {rect.width * 0.5, rect.height * 0.5}, quarter);
    return polygon;
}

Polygon makeRoundedRectangle(const SRect& rect, double radius) {
    const double limit = 0.5 * std::min(std::abs(rect.width), std::abs(rect.height));
    if (!(radius > 0) || limit == 0) return makeRectangle(rect);
    const double r = std::min(radius, limit);
    Polygon polygon;
    addQuarter(polygon, {rect.getRight() - r, rect.getBottom() - r}, {r, r}, 0);
    addQuarter(polygon, {rect.left + r, rect.getBottom() - r}, {r, r}, 1);
    addQuarter(polygon, {rect.left + r, rect.top + r}, {r, r}, 2);
    addQuarter(polygon, {rect.getRight() - r, rect.top + r}, {r, r}, 3);
    return polygon;
}

Polygon transform(const CMatrix& matrix, Polygon polygon) {
    for (SPoint& point : polygon) point = matrix.apply(point);
    return polygon;
}

SRect getBounds(const Polygon& polygon) {
    if (polygon.empty()) return {};
    SRect bounds{polygon[0].x, polygon[0].y, 0, 0};
    for (const SPoint& point : polygon) bounds = bounds.united({point.x, point.y, 0, 0});
    return bounds;
}

bool contains(const Polygon& polygon, SPoint point) {
    bool isInside = false;
    anyEdge(polygon, [&](SPoint a, SPoint b) {
        if ((a.y > point.y) != (b.y > point.y) && point.x < (b.x - a.x) * (point.y - a.y) / (b.y - a.y) + a.x)
            isInside = !isInside;
        return false;
    });
    return isInside;
}

bool intersect(const Polygon& first, const Polygon& second) {
    if (first.empty() || second.empty()) return false;
    if (contains(first, second[0]) || contains(second, first[0])) return true;
    return anyEdge(first, [&](SPoint a, SPoint b) {
        return anyEdge(second, [&](SPoint c, SPoint d) { return doSegmentsMeet(a, b, c, d); });
    });
}

bool intersectsCircle(const Polygon& polygon, SPoint center, double radius) {
    if (contains(polygon, center)) return true;
    return anyEdge(polygon,
                   [&](SPoint a, SPoint b) { return getSquaredDistance(a, b, center) <= radius * radius; });
}

} // namespace graphics
