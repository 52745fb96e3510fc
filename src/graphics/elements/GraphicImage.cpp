#include "graphics/elements/GraphicImage.h"

#include "graphics/elements/CloneAs.h"

namespace graphics {

CGraphicImage::CGraphicImage() {
    SetFlags(GetFlags() | kFlagEditable);
}

P<CGraphicElement> CGraphicImage::Clone() const {
    return cloneAs(*this);
}

void CGraphicImage::Assign(const CGraphicElement& other) {
    if (const auto* same = dynamic_cast<const CGraphicImage*>(&other)) {
        m_bitmap = same->m_bitmap;
        m_fileName = same->m_fileName;
        m_scaleMargins = same->m_scaleMargins;
        m_isNoScale = same->m_isNoScale;
    }
    CGraphicElement::Assign(other);
}

void CGraphicImage::Reset() {
    SetBitmap(nullptr);
    m_fileName.clear();
}

void CGraphicImage::SetBitmap(const P<CBitmap>& bitmap) {
    m_bitmap = bitmap;
}

void CGraphicImage::SetScaleMargins(const SScaleMargins& margins) {
    m_scaleMargins = margins;
}

void CGraphicImage::SetNoScale(bool isNoScale) {
    m_isNoScale = isNoScale;
}

} // namespace graphics
