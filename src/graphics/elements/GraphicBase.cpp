#include "graphics/elements/GraphicBase.h"

#include <cmath>

namespace graphics {

std::string CGraphicBase::GetName() const {
    return m_name;
}

std::string CGraphicBase::GetDisplayName() const {
    return m_name;
}

SPoint CGraphicBase::GetTopLeft() const {
    return {m_center.x - m_size.width * 0.5, m_center.y - m_size.height * 0.5};
}

void CGraphicBase::SetTopLeft(double x, double y) {
    const SSize size = GetSize();
    SetCenter(x + size.width * 0.5, y + size.height * 0.5);
}

SPoint CGraphicBase::GetCenter() const {
    return m_center;
}

void CGraphicBase::SetCenter(double x, double y) {
    m_center = {x, y};
    NotifyChanged();
}

SSize CGraphicBase::GetSize() const {
    return m_size;
}

void CGraphicBase::SetSize(double width, double height) {
    m_size = {width, height};
    NotifyChanged();
}

void CGraphicBase::SetBoundingSize(double width, double height) {
    if (std::fmod(m_rotation, 90) == 0) {
        const SPoint turned = CMatrix::rotation(-m_rotation).applyToVector({width, height});
        SetSize(std::abs(turned.x), std::abs(turned.y));
        return;
    }
    const SSize bounds = GetBoundingSize();
    const double scaleX = bounds.width > 0 ? width / bounds.width : 1;
    const double scaleY = bounds.height > 0 ? height / bounds.height : 1;
    const CMatrix matrix = CMatrix::scaling(scaleX, scaleY) * CMatrix::rotation(m_rotation);
    const SPoint across = matrix.applyToVector({m_size.width, 0});
    const SPoint down = matrix.applyToVector({0, m_size.height});
    SetSize(std::max(1.0, std::hypot(across.x, across.y)), std::max(1.0, std::hypot(down.x, down.y)));
}

SSize CGraphicBase::GetBoundingSize() const {
    const auto [sine, cosine] = getSineCosine(m_rotation);
    return {std::abs(m_size.height * sine) + std::abs(m_size.width * cosine),
            std::abs(m_size.width * sine) + std::abs(m_size.height * cosine)};
}

void CGraphicBase::SetRotation(double degrees) {
    double whole = std::isfinite(degrees) ? std::fmod(std::trunc(degrees), 360.0) : 0.0;
    if (whole < 0) whole += 360;
    m_rotation = whole + 0.0; // -0 becomes 0
    NotifyChanged();
}

double CGraphicBase::GetRotation() const {
    return m_rotation;
}

void CGraphicBase::SetMirrored(EAxis axis, bool isMirrored) {
    m_isMirrored[static_cast<int>(axis)] = isMirrored;
}

bool CGraphicBase::IsMirrored(EAxis axis) const {
    return m_isMirrored[static_cast<int>(axis)];
}

SRect CGraphicBase::GetRect() const {
    return SRect::fromCenter(m_center, m_size);
}

CMatrix CGraphicBase::GetBoxMatrix() const {
    return GetPlacementMatrix() * CMatrix::scaling(m_size.width, m_size.height) *
           CMatrix::translation(-0.5, -0.5);
}

CMatrix CGraphicBase::GetPlacementMatrix() const {
    return CMatrix::translation(m_center.x, m_center.y) * CMatrix::rotation(m_rotation);
}

void CGraphicBase::Paint(CPaintContext&) const {}

void CGraphicBase::SetFlags(uint32_t flags) {
    m_flags = flags;
}

uint32_t CGraphicBase::GetFlags() const {
    return m_flags;
}

bool CGraphicBase::IsLocked() const {
    return HasFlag(kFlagLocked);
}

void CGraphicBase::SetLocked(bool isLocked) {
    SetFlags(isLocked ? GetFlags() | kFlagLocked : GetFlags() & ~kFlagLocked);
}

int CGraphicBase::GetCursor() const {
    return -1;
}

bool CGraphicBase::HasResource() const {
    return false;
}

bool CGraphicBase::IsDefinedByPoints() const {
    return false;
}

SRect CGraphicBase::GetBoundingBox() const {
    return SRect::fromCenter(GetCenter(), GetBoundingSize());
}

void CGraphicBase::AddListener(IGraphicListener* listener) {
    m_listeners.push_back(listener);
}

void CGraphicBase::RemoveListener(IGraphicListener* listener) {
    const auto found = std::find(m_listeners.begin(), m_listeners.end(), listener);
    if (found != m_listeners.end()) m_listeners.erase(found);
}

bool CGraphicBase::HasListener(const IGraphicListener* listener) const {
    return std::find(m_listeners.begin(), m_listeners.end(), listener) != m_listeners.end();
}

void CGraphicBase::NotifyChanged() {
    if (m_listeners.empty()) return;
    // A listener may drop the last reference to this element, and may remove another listener, which is then
    // no longer called.
    const auto self = P<CGraphicBase>::share(this);
    const std::vector<IGraphicListener*> listeners = m_listeners;
    for (IGraphicListener* listener : listeners)
        if (HasListener(listener)) listener->OnGraphicChanged(*this);
}

void CGraphicBase::AssignBase(const CGraphicBase& other) {
    m_center = other.m_center;
    m_size = other.m_size;
    m_name = other.m_name;
    m_rotation = other.m_rotation;
    m_flags = other.m_flags;
    std::copy(std::begin(other.m_isMirrored), std::end(other.m_isMirrored), m_isMirrored);
    m_isVisible = other.m_isVisible;
    NotifyChanged();
}

} // namespace graphics
