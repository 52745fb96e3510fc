#include "graphics/elements/BasicElements.h"

#include "graphics/elements/CloneAs.h"

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
}

void CGraphicFilled::SetPen(const SPen& pen) {
    m_pen = pen;
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

} // namespace graphics
