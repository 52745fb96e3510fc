#include "graphics/elements/BasicElements.h"

#include "graphics/elements/CloneAs.h"

#include "graphics/painting/PaintContext.h"
#include <cmath>

namespace graphics {

CGraphicPaper::CGraphicPaper() {
    SetFlags(GetFlags() & ~(kFlagSelectable | kFlagEditable));
}

P<CGraphicElement> CGraphicPaper::Clone() const {
    return cloneAs(*this);
}

P<CGraphicElement> CGraphicPoint::Clone() const {
    return cloneAs(*this);
}

P<CGraphicElement> CGraphicDummy::Clone() const {
    return cloneAs(*this);
}

void CGraphicFilled::Assign(const CGraphicElement& other) {
    if (const auto* same = dynamic_cast<const CGraphicFilled*>(&other)) {
        m_brush = same->m_brush;
        m_pen = same->m_pen;
    }
    CGraphicElement::Assign(other);
}

double CGraphicFilled::GetOverhang() const {
    return m_pen.isVisible() ? m_pen.width * 0.5 : 0;
}

void CGraphicFilled::SetBrush(const SBrush& brush) {
    m_brush = brush;
    DropHitMask();
}

void CGraphicFilled::SetPen(const SPen& pen) {
    m_pen = pen;
    DropHitMask();
}

bool CGraphicCircle::ContainsPoint(double x, double y) const {
    const SPoint center = GetCenter();
    return std::hypot(x - center.x, y - center.y) <= GetCircleRect().width * 0.5;
}

P<CGraphicElement> CGraphicCircle::Clone() const {
    return cloneAs(*this);
}

SRect CGraphicCircle::GetCircleRect() const {
    const SSize size = GetSize();
    const double diameter = std::min(std::abs(size.width), std::abs(size.height));
    return SRect::fromCenter({}, {diameter, diameter});
}

Polygon CGraphicCircle::GetOutline() const {
    return transform(GetContentMatrix(), makeEllipse(GetCircleRect()));
}

P<CGraphicElement> CGraphicRectangle::Clone() const {
    return cloneAs(*this);
}

P<CGraphicElement> CGraphicStateButton::Clone() const {
    return cloneAs(*this);
}

void CGraphicStateButton::Assign(const CGraphicElement& other) {
    if (const auto* same = dynamic_cast<const CGraphicStateButton*>(&other)) {
        m_label = same->m_label;
        m_buttonHint = same->m_buttonHint;
    }
    CGraphicElement::Assign(other);
}

P<CGraphicElement> CGraphicLabel::Clone() const {
    return cloneAs(*this);
}

void CGraphicLabel::Assign(const CGraphicElement& other) {
    if (const auto* same = dynamic_cast<const CGraphicLabel*>(&other)) {
        m_text = same->m_text;
        m_font = same->m_font;
        m_colour = same->m_colour;
    }
    CGraphicElement::Assign(other);
}

void CGraphicStateButton::SetLabel(const std::string& label) {
    m_label = label;
    DropHitMask();
}

void CGraphicLabel::SetText(const std::string& text) {
    m_text = text;
    DropHitMask();
}

void CGraphicLabel::SetFont(const SFont& font) {
    m_font = font;
    DropHitMask();
}

void CGraphicLabel::SetColour(const SColour& colour) {
    m_colour = colour;
    DropHitMask();
}

void CGraphicPaper::PaintContent(CPaintContext& context) const {
    if (context.GetOutputKind() != EOutputKind::screen) return;
    const SRect rect = GetLocalRect();
    const double pixel = 1 / context.GetMatrix().getMeanScale();
    SPen shadow{{100, 100, 100, 255}, kStyleSolid, pixel};
    const SFill fill{{{240, 240, 240, 255}}, {}, {}};
    context.GetGraphics().DrawPath(CPath::rectangle(rect), &fill, &shadow);
    for (const double offset : {pixel, 2 * pixel}) {
        CPath line;
        line.MoveTo({rect.getRight() + offset, rect.top + offset});
        line.LineTo({rect.getRight() + offset, rect.getBottom() + offset});
        line.LineTo({rect.left + offset, rect.getBottom() + offset});
        context.GetGraphics().DrawPath(line, nullptr, &shadow);
    }
}

void CGraphicCircle::PaintContent(CPaintContext& context) const {
    const SFill fill{GetBrush(), {}, {}};
    context.GetGraphics().DrawPath(CPath::ellipse(GetCircleRect()), &fill, &GetPen());
}

void CGraphicRectangle::PaintContent(CPaintContext& context) const {
    const SFill fill{GetBrush(), {}, {}};
    context.GetGraphics().DrawPath(CPath::rectangle(GetLocalRect()), &fill, &GetPen());
}

} // namespace graphics
