// Outlines that are filled and stroked.
#pragma once

#include "graphics/geometry/Polygon.h"

namespace graphics {

class GRAPHICS_API CPath {
public:
    enum class EVerb { move, line, curve, close };
    struct SSegment {
        EVerb verb;
        SPoint end;      // of move, line and curve
        SPoint control1; // of curve
        SPoint control2;
    };

    void MoveTo(SPoint point);
    void LineTo(SPoint point);
    // A cubic Bézier curve.
    void CurveTo(SPoint control1, SPoint control2, SPoint end);
    void Close();

    static CPath polygon(const Polygon& points);
    static CPath rectangle(const SRect& rect);
    // Deviates from the ellipse by less than a hundred-thousandth of its radius.
    static CPath ellipse(const SRect& rect);
    // The radius is limited to half of the smaller side.
    static CPath roundedRectangle(const SRect& rect, double radius);

    bool IsEmpty() const { return m_segments.empty(); }
    const std::vector<SSegment>& GetSegments() const { return m_segments; }

private:
    // Continues clockwise from the current point.
    void addArc(SPoint center, SSize radii, double fromDegrees, double toDegrees);

    std::vector<SSegment> m_segments;
};

} // namespace graphics
