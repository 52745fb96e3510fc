#include "graphics/painting/Path.h"

#include <cmath>
#include <numbers>

namespace graphics {

void CPath::MoveTo(SPoint point) {
    m_segments.push_back({EVerb::move, point, {}, {}});
}

void CPath::LineTo(SPoint point) {
    m_segments.push_back({EVerb::line, point, {}, {}});
}

void CPath::CurveTo(SPoint control1, SPoint control2, SPoint end) {
    m_segments.push_back({EVerb::curve, end, control1, control2});
}

void CPath::Close() {
    m_segments.push_back({EVerb::close, {}, {}, {}});
}

void CPath::addArc(SPoint center, SSize radii, double fromDegrees, double toDegrees) {
    constexpr double kStep = 45;
    const double reach = 4.0 / 3.0 * std::tan(kStep / 4 * std::numbers::pi / 180);
    for (double degrees = fromDegrees; degrees < toDegrees; degrees += kStep) {
        const auto [sine, cosine] = getSineCosine(degrees);
        const auto [endSine, endCosine] = getSineCosine(degrees + kStep);
        const auto at = [&](double x, double y) {
            return SPoint{center.x + radii.width * x, center.y + radii.height * y};
        };
        CurveTo(at(cosine - reach * sine, sine + reach * cosine),
                at(endCosine + reach * endSine, endSine - reach * endCosine), at(endCosine, endSine));
    }
}

CPath CPath::polygon(const Polygon& points) {
    CPath path;
    for (size_t i = 0; i < points.size(); ++i)
        if (i == 0)
            path.MoveTo(points[i]);
        else if (i + 1 < points.size() || points[i] != points[0]) // the end of a closed polygon is a join
            path.LineTo(points[i]);
    if (!points.empty()) path.Close();
    return path;
}

CPath CPath::rectangle(const SRect& rect) {
    return polygon(makeRectangle(rect));
}

CPath CPath::ellipse(const SRect& rect) {
    CPath path;
    const SPoint center = rect.getCenter();
    path.MoveTo({rect.getRight(), center.y});
    path.addArc(center, {rect.width * 0.5, rect.height * 0.5}, 0, 360);
    path.Close();
    return path;
}

CPath CPath::roundedRectangle(const SRect& rect, double radius) {
    const double r = std::min(radius, 0.5 * std::min(rect.width, rect.height));
    if (!(r > 0)) return rectangle(rect);
    CPath path;
    path.MoveTo({rect.getRight(), rect.getBottom() - r});
    path.addArc({rect.getRight() - r, rect.getBottom() - r}, {r, r}, 0, 90);
    path.LineTo({rect.left + r, rect.getBottom()});
    path.addArc({rect.left + r, rect.getBottom() - r}, {r, r}, 90, 180);
    path.LineTo({rect.left, rect.top + r});
    path.addArc({rect.left + r, rect.top + r}, {r, r}, 180, 270);
    path.LineTo({rect.getRight() - r, rect.top});
    path.addArc({rect.getRight() - r, rect.top + r}, {r, r}, 270, 360);
    path.Close();
    return path;
}

} // namespace graphics
