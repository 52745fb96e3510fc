#include "graphics/elements/GraphicShape.h"

#include "graphics/documents/FreeForm.h"
#include "graphics/elements/CloneAs.h"
#include "graphics/painting/PaintContext.h"

namespace graphics {

CGraphicShape::CGraphicShape() {
    SetFlags(GetFlags() | kFlagEditable | kFlagStyled);
}

CGraphicShape::~CGraphicShape() = default;

P<CGraphicElement> CGraphicShape::Clone() const {
    return cloneAs(*this);
}

void CGraphicShape::Assign(const CGraphicElement& other) {
    if (const auto* same = dynamic_cast<const CGraphicShape*>(&other)) {
        m_type = same->m_type;
        m_gradient = same->m_gradient;
        m_cornerRadius = same->m_cornerRadius;
        m_freeForm = same->m_freeForm;
    }
    CGraphicFilled::Assign(other);
}

Polygon CGraphicShape::GetOutline() const {
    const SRect rect = GetLocalRect();
    switch (m_type) {
    case EShapeType::ellipse:
        return transform(GetContentMatrix(), makeEllipse(rect));
    case EShapeType::roundedRectangle:
        return transform(GetContentMatrix(), makeRoundedRectangle(rect, m_cornerRadius));
    case EShapeType::freeForm:
        return m_freeForm ? transform(GetContentMatrix(), m_freeForm->GetPolygon(rect)) : Polygon();
    default:
        return transform(GetContentMatrix(), makeRectangle(rect));
    }
}

double CGraphicShape::GetOverhang() const {
    // Joins of acute angles reach further than half the pen: up to the limit of a mitre.
    return m_type == EShapeType::freeForm ? 10 * CGraphicFilled::GetOverhang()
                                          : CGraphicFilled::GetOverhang();
}

void CGraphicShape::SetShapeType(EShapeType type) {
    m_type = type;
    DropHitMask();
}

void CGraphicShape::SetGradient(const SGradient& gradient) {
    m_gradient = gradient;
    DropHitMask();
}

void CGraphicShape::SetCornerRadius(double radius) {
    m_cornerRadius = radius;
    DropHitMask();
}

void CGraphicShape::SetFreeForm(const P<CFreeForm>& freeForm) {
    m_freeForm = freeForm;
    DropHitMask();
}

void CGraphicShape::PaintContent(CPaintContext& context) const {
    const SRect rect = GetLocalRect();
    CPath path;
    switch (m_type) {
    case EShapeType::rectangle:
        path = CPath::rectangle(rect);
        break;
    case EShapeType::ellipse:
        path = CPath::ellipse(rect);
        break;
    case EShapeType::roundedRectangle:
        path = CPath::roundedRectangle(rect, m_cornerRadius);
        break;
    case EShapeType::freeForm:
        if (m_freeForm) path = CPath::polygon(m_freeForm->GetPolygon(rect));
        break;
    }
    const SFill fill{GetBrush(), m_gradient, rect};
    context.GetGraphics().DrawPath(path, &fill, &GetPen());
}

} // namespace graphics
