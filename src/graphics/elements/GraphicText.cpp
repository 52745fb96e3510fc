#include "graphics/elements/GraphicText.h"

#include "graphics/elements/CloneAs.h"
#include "graphics/text/LayoutCache.h"
#include "graphics/text/RichTextParser.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

namespace graphics {

CGraphicText::CGraphicText() {
    SetFlags(GetFlags() | kFlagEditable);
}

CGraphicText::~CGraphicText() = default;

std::string CGraphicText::GetHint() const {
    if (!GetHintText().empty() || !m_text || !hasText(*m_text)) return CGraphicElement::GetHint();
    return peru::CString::toStdString(
        peru::localize("graphics.CGraphicText.ClickToEditText", "Double click to edit text"));
}

P<CGraphicElement> CGraphicText::Clone() const {
    return cloneAs(*this);
}

void CGraphicText::Assign(const CGraphicElement& other) {
    if (const auto* same = dynamic_cast<const CGraphicText*>(&other)) {
        m_text = same->m_text;
        m_placement = same->m_placement;
    }
    CGraphicElement::Assign(other);
}

void CGraphicText::SetText(const P<CRichText>& text) {
    m_text = text;
    DropHitMask();
}

void CGraphicText::SetVerticalPlacement(EVerticalPlacement placement) {
    m_placement = placement;
    DropHitMask();
}

std::string CircleTypeToXml(ECircleType type) {
    if (type == ECircleType::concav) return "concav";
    if (type == ECircleType::convex) return "convex";
    throw peru::CError("CircleTypeToXml. Unknwown type");
}

ECircleType CircleTypeFromXml(std::string_view text) {
    if (text == "concav") return ECircleType::concav;
    if (text == "convex") return ECircleType::convex;
    throw peru::CError(peru::CString::fromUTF8("CircleTypeFromXml. Unknwown type:" + std::string(text)));
}

void CGraphicTextCircle::SetSize(double width, double height) {
    const double side = std::min(width, height);
    CGraphicText::SetSize(side, side);
}

void CGraphicTextCircle::SetBoundingSize(double width, double height) {
    SetSize(width, height);
}

SSize CGraphicTextCircle::GetBoundingSize() const {
    return GetSize();
}

P<CGraphicElement> CGraphicTextCircle::Clone() const {
    return cloneAs(*this);
}

void CGraphicTextCircle::Assign(const CGraphicElement& other) {
    if (const auto* same = dynamic_cast<const CGraphicTextCircle*>(&other)) m_circleType = same->m_circleType;
    CGraphicText::Assign(other);
}

void CGraphicTextCircle::SetCircleType(ECircleType type) {
    m_circleType = type;
    DropHitMask();
}

} // namespace graphics
