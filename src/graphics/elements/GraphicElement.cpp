#include "graphics/elements/GraphicElement.h"

#include "graphics/elements/IdGenerator.h"
#include "graphics/painting/OffScreen.h"
#include "graphics/painting/PaintContext.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <cmath>

namespace graphics {

namespace {

int64_t makeUnique() {
    static CIdGenerator s_ids;
    // In files, 0 marks an element that is not shared.
    const int64_t id = s_ids.GetNext();
    return id > 0 ? id : s_ids.GetNext();
}

bool isNear(const SRect& a, const SRect& b) {
    constexpr double kTolerance = 0.001;
    return std::abs(a.left - b.left) <= kTolerance && std::abs(a.top - b.top) <= kTolerance &&
           std::abs(a.width - b.width) <= kTolerance && std::abs(a.height - b.height) <= kTolerance;
}

bool isOutlined(GraphicElementType type) {
    return type == GraphicElementType::rectangle || type == GraphicElementType::shape;
}

double getRadius(const CGraphicElement& circle) {
    const SSize size = circle.GetSize();
    return 0.5 * std::min(std::abs(size.width), std::abs(size.height));
}

} // namespace

CGraphicElement::CGraphicElement() : m_unique(makeUnique()) {}

CGraphicElement::~CGraphicElement() = default;

std::string CGraphicElement::GetDisplayName() const {
    const std::string name = GetName();
    return name.empty() ? GetGraphicTypeName(GetType()) : name;
}

void CGraphicElement::SetMirrored(EAxis axis, bool isMirrored) {
    CGraphicBase::SetMirrored(axis, isMirrored);
    DropHitMask();
}

void CGraphicElement::NotifyChanged() {
    DropHitMask();
    CGraphicBase::NotifyChanged();
}

void CGraphicElement::Paint(CPaintContext& context) const {
    const CPaintContext::CScope scope(context, GetContentMatrix(), m_isColoured);
    if (context.CanSee(GetLocalRect().inflated(GetOverhang()))) PaintContent(context);
}

void CGraphicElement::PaintContent(CPaintContext&) const {}

void CGraphicElement::UpdateHitMask(const CMatrix& matrix) {
    const SRect box = (matrix * GetContentMatrix()).getBounds(GetLocalRect().inflated(GetOverhang()));
    if (m_hitMask && isNear(m_hitMask->box, box)) return;
    const double left = std::floor(box.left), top = std::floor(box.top);
    const double width = std::ceil(box.getRight()) - left, height = std::ceil(box.getBottom()) - top;
    // Far from the limits of int, and false for NaN.
    if (!(std::abs(left) < 1e9 && std::abs(top) < 1e9 && width < 1e9 && height < 1e9))
        throw peru::CInvalidArgError("matrix", "UpdateHitMask", P<peru::IBase>::share(this));
    COffScreen picture(std::max(int64_t{1}, static_cast<int64_t>(width)),
                       std::max(int64_t{1}, static_cast<int64_t>(height)));
    CPaintContext context(picture.GetGraphics(), CMatrix::translation(-left, -top) * matrix);
    Paint(context);
    auto mask = std::make_unique<SHitMask>();
    mask->box = box;
    mask->left = static_cast<int>(left);
    mask->top = static_cast<int>(top);
    mask->width = picture.GetWidth();
    mask->height = picture.GetHeight();
    mask->alpha.reserve(static_cast<size_t>(mask->width) * static_cast<size_t>(mask->height));
    for (int y = 0; y < mask->height; ++y) {
        const uint32_t* const row = picture.GetRow(y);
        for (int x = 0; x < mask->width; ++x) mask->alpha.push_back(static_cast<uint8_t>(row[x] >> 24));
    }
    m_hitMask = std::move(mask);
}

std::string CGraphicElement::GetHint() const {
    if (!m_hintText.empty() || !HasFlag(kFlagEditable)) return m_hintText;
    return peru::CString::toStdString(
        peru::localize("graphics.CGraphicElement.ClickToEdit", "Double click to edit"));
}

bool CGraphicElement::ContainsPoint(double x, double y) const {
    const SPoint center = GetCenter();
    const SPoint local = CMatrix::rotation(-GetRotation()).applyToVector({x - center.x, y - center.y});
    return GetLocalRect().contains(local);
}

void CGraphicElement::Assign(const CGraphicElement& other) {
    if (&other == this) return;
    m_tags = other.m_tags;
    m_groups = other.m_groups;
    m_isColoured = other.m_isColoured;
    m_isModified = other.m_isModified;
    m_contentId = other.m_contentId;
    m_contentIndex = other.m_contentIndex;
    m_textId = other.m_textId;
    m_hintText = other.m_hintText;
    m_typeName = other.m_typeName;
    AssignBase(other);
}

std::string CGraphicElement::GetTypeName() const {
    return m_typeName;
}

void CGraphicElement::SetColoured(bool isColoured) {
    m_isColoured = isColoured;
}

bool CGraphicElement::IsColoured() const {
    return m_isColoured;
}

void CGraphicElement::SetHintText(const std::string& hint) {
    m_hintText = hint;
}

void CGraphicElement::Reset() {}

bool CGraphicElement::Intersects(const CGraphicElement& other) const {
    if (other.GetType() < GetType()) return other.Intersects(*this);
    const GraphicElementType first = GetType(), second = other.GetType();
    if (first == GraphicElementType::circle) {
        if (isOutlined(second)) return intersectsCircle(other.GetOutline(), GetCenter(), getRadius(*this));
        if (second != GraphicElementType::circle) return false;
        const SPoint a = GetCenter(), b = other.GetCenter();
        return std::hypot(a.x - b.x, a.y - b.y) <= getRadius(*this) + getRadius(other);
    }
    return first == second && isOutlined(first) && intersect(GetOutline(), other.GetOutline());
}

Polygon CGraphicElement::GetOutline() const {
    return transform(GetContentMatrix(), makeRectangle(GetLocalRect()));
}

double CGraphicElement::GetOverhang() const {
    return 0;
}

void CGraphicElement::AddGroup(int32_t group) {
    if (group > 0) m_groups.insert(group);
}

bool CGraphicElement::SharesGroupWith(const CGraphicElement& other) const {
    return std::any_of(m_groups.begin(), m_groups.end(),
                       [&](int32_t group) { return other.m_groups.count(group) != 0; });
}

CMatrix CGraphicElement::GetContentMatrix() const {
    return GetPlacementMatrix() *
           CMatrix::scaling(IsMirrored(EAxis::x) ? -1 : 1, IsMirrored(EAxis::y) ? -1 : 1);
}

} // namespace graphics
