// Points, sizes and upright rectangles of the model space.
#pragma once

#include <algorithm>

namespace graphics {

// Lengths are millimetres; y points down.
struct SPoint {
    double x = 0;
    double y = 0;

    bool operator==(const SPoint&) const = default;
};

struct SSize {
    double width = 0;
    double height = 0;

    bool operator==(const SSize&) const = default;
};

struct SRect {
    double left = 0;
    double top = 0;
    double width = 0;
    double height = 0;

    static SRect fromCenter(SPoint center, SSize size) {
        return {center.x - size.width * 0.5, center.y - size.height * 0.5, size.width, size.height};
    }
    static SRect fromEdges(double left, double top, double right, double bottom) {
        return {left, top, right - left, bottom - top};
    }

    double getRight() const { return left + width; }
    double getBottom() const { return top + height; }
    SPoint getCenter() const { return {left + width * 0.5, top + height * 0.5}; }
    SSize getSize() const { return {width, height}; }
    // The edges belong to the rectangle.
    bool contains(SPoint point) const {
        return point.x >= left && point.x <= getRight() && point.y >= top && point.y <= getBottom();
    }
    SRect united(const SRect& other) const {
        return fromEdges(std::min(left, other.left), std::min(top, other.top),
                         std::max(getRight(), other.getRight()), std::max(getBottom(), other.getBottom()));
    }
    SRect inflated(double margin) const {
        return {left - margin, top - margin, width + 2 * margin, height + 2 * margin};
    }

    bool operator==(const SRect&) const = default;
};

} // namespace graphics
