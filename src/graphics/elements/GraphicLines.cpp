#include "graphics/elements/GraphicLines.h"

#include "graphics/elements/CloneAs.h"

#include "graphics/painting/PaintContext.h"
#include <cmath>

namespace graphics {

namespace {

constexpr double kHeadLength = 3;       // millimetres
constexpr double kHeadWidths = 4;       // at least this many pen widths
constexpr double kHalfHeadAngle = 0.35; // half of the head's width per length
constexpr double kHalfBar = 1.5;        // millimetres

// Moves the ends of one axis so that they span `size` around their middle and keep their order.
void span(double& start, double& end, double size) {
    const double middle = (start + end) * 0.5;
    const double half = start <= end ? size * 0.5 : size * -0.5;
    start = middle - half;
    end = middle + half;
}

} // namespace

void CGraphicLine::SetCenter(double x, double y) {
    const SPoint old = GetCenter();
    m_start = {m_start.x + (x - old.x), m_start.y + (y - old.y)};
    m_end = {m_end.x + (x - old.x), m_end.y + (y - old.y)};
    CGraphicElement::SetCenter(x, y);
}

void CGraphicLine::SetSize(double width, double height) {
    span(m_start.x, m_end.x, width);
    span(m_start.y, m_end.y, height);
    CGraphicElement::SetSize(width, height);
}

P<CGraphicElement> CGraphicLine::Clone() const {
    return cloneAs(*this);
}

void CGraphicLine::Assign(const CGraphicElement& other) {
    if (const auto* same = dynamic_cast<const CGraphicLine*>(&other)) {
        m_start = same->m_start;
        m_end = same->m_end;
        m_pen = same->m_pen;
    }
    CGraphicElement::Assign(other);
}

double CGraphicLine::GetOverhang() const {
    return m_pen.width * 0.5;
}

void CGraphicLine::SetLine(SPoint start, SPoint end) {
    CGraphicElement::SetCenter((start.x + end.x) * 0.5, (start.y + end.y) * 0.5);
    // Before the last notification, so that listeners see the new line; exactly the given points.
    m_start = start;
    m_end = end;
    CGraphicElement::SetSize(std::abs(end.x - start.x), std::abs(end.y - start.y));
}

void CGraphicLine::SetPen(const SPen& pen) {
    m_pen = pen;
    DropHitMask();
}

SPoint CGraphicLine::GetLocalStart() const {
    return {m_start.x - GetCenter().x, m_start.y - GetCenter().y};
}

SPoint CGraphicLine::GetLocalEnd() const {
    return {m_end.x - GetCenter().x, m_end.y - GetCenter().y};
}

P<CGraphicElement> CGraphicArrow::Clone() const {
    return cloneAs(*this);
}

double CGraphicArrow::GetHeadLength() const {
    return std::max(kHeadLength, kHeadWidths * GetPen().width);
}

double CGraphicArrow::GetOverhang() const {
    return std::max(CGraphicLine::GetOverhang(), GetHeadLength() * kHalfHeadAngle);
}

Polygon CGraphicArrow::GetHead() const {
    const SPoint start = GetLocalStart(), tip = GetLocalEnd();
    const double length = std::hypot(tip.x - start.x, tip.y - start.y);
    if (!(length > 0)) return {};
    // A short arrow is all head.
    const double head = std::min(GetHeadLength(), length);
    const SPoint along{(tip.x - start.x) / length * head, (tip.y - start.y) / length * head};
    const SPoint base{tip.x - along.x, tip.y - along.y};
    const SPoint across{-along.y * kHalfHeadAngle, along.x * kHalfHeadAngle};
    return {tip, {base.x + across.x, base.y + across.y}, {base.x - across.x, base.y - across.y}};
}

P<CGraphicElement> CGraphicDimension::Clone() const {
    return cloneAs(*this);
}

double CGraphicDimension::GetOverhang() const {
    return kHalfBar + CGraphicLine::GetOverhang();
}

void CGraphicLine::PaintContent(CPaintContext& context) const {
    CPath path;
    path.MoveTo(GetLocalStart());
    path.LineTo(GetLocalEnd());
    context.GetGraphics().DrawPath(path, nullptr, &m_pen);
}

void CGraphicArrow::PaintContent(CPaintContext& context) const {
    const Polygon head = GetHead();
    if (head.empty()) return;
    // The line ends inside the head, so that its blunt end does not cover the tip.
    CPath line;
    line.MoveTo(GetLocalStart());
    line.LineTo({(head[1].x + head[2].x) * 0.5, (head[1].y + head[2].y) * 0.5});
    context.GetGraphics().DrawPath(line, nullptr, &GetPen());
    const SFill fill{{GetPen().colour, GetPen().isVisible() ? kStyleSolid : kStyleTransparent}, {}, {}};
    context.GetGraphics().DrawPath(CPath::polygon(head), &fill, nullptr);
}

void CGraphicDimension::PaintContent(CPaintContext& context) const {
    CGraphicLine::PaintContent(context);
    const SPoint start = GetLocalStart(), end = GetLocalEnd();
    const double length = std::hypot(end.x - start.x, end.y - start.y);
    if (!(length > 0)) return;
    const SPoint across{-(end.y - start.y) / length * kHalfBar, (end.x - start.x) / length * kHalfBar};
    for (const SPoint& point : {start, end}) {
        CPath bar;
        bar.MoveTo({point.x - across.x, point.y - across.y});
        bar.LineTo({point.x + across.x, point.y + across.y});
        context.GetGraphics().DrawPath(bar, nullptr, &GetPen());
    }
}

} // namespace graphics
