#include "graphics/geometry/Matrix.h"

#include <cmath>
#include <numbers>

namespace graphics {

SSineCosine getSineCosine(double degrees) {
    const double turn = std::fmod(degrees, 360.0);
    if (turn == 0) return {0, 1};
    if (turn == 90 || turn == -270) return {1, 0};
    if (turn == 180 || turn == -180) return {0, -1};
    if (turn == 270 || turn == -90) return {-1, 0};
    const double radians = turn * std::numbers::pi / 180.0;
    return {std::sin(radians), std::cos(radians)};
}

CMatrix CMatrix::rotation(double degrees) {
    const auto [sine, cosine] = getSineCosine(degrees);
    return {cosine, sine, -sine, cosine, 0, 0};
}

CMatrix CMatrix::operator*(const CMatrix& first) const {
    const SPoint x = applyToVector({first.xx, first.yx});
    const SPoint y = applyToVector({first.xy, first.yy});
    const SPoint origin = apply({first.x0, first.y0});
    return {x.x, x.y, y.x, y.y, origin.x, origin.y};
}

std::array<SPoint, 4> CMatrix::getCorners(const SRect& rect) const {
    return {apply({rect.left, rect.top}), apply({rect.getRight(), rect.top}),
            apply({rect.getRight(), rect.getBottom()}), apply({rect.left, rect.getBottom()})};
}

SRect CMatrix::getBounds(const SRect& rect) const {
    const std::array<SPoint, 4> corners = getCorners(rect);
    const auto [left, right] = std::minmax({corners[0].x, corners[1].x, corners[2].x, corners[3].x});
    const auto [top, bottom] = std::minmax({corners[0].y, corners[1].y, corners[2].y, corners[3].y});
    return SRect::fromEdges(left, top, right, bottom);
}

double CMatrix::getMeanScale() const {
    return std::sqrt(std::abs(getDeterminant()));
}

std::optional<CMatrix> CMatrix::getInverse() const {
    const double determinant = getDeterminant();
    if (determinant == 0 || !std::isfinite(1.0 / determinant)) return std::nullopt;
    const CMatrix turn(yy / determinant, -yx / determinant, -xy / determinant, xx / determinant, 0, 0);
    const SPoint origin = turn.applyToVector({x0, y0});
    return CMatrix(turn.xx, turn.yx, turn.xy, turn.yy, -origin.x, -origin.y);
}

} // namespace graphics
