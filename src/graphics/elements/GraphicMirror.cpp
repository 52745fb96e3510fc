#include "graphics/elements/GraphicMirror.h"

#include "graphics/documents/GraphicDocument.h"
#include "graphics/elements/CloneAs.h"

namespace graphics {

CGraphicMirror::CGraphicMirror() = default;

CGraphicMirror::~CGraphicMirror() = default;

P<CGraphicElement> CGraphicMirror::Clone() const {
    return cloneAs(*this);
}

void CGraphicMirror::Assign(const CGraphicElement& other) {
    const auto* same = dynamic_cast<const CGraphicMirror*>(&other);
    if (same && same != this) m_document = same->m_document ? same->m_document->Clone() : nullptr;
    CGraphicElement::Assign(other);
}

void CGraphicMirror::SetDocument(const P<CGraphicDocument>& document) {
    m_document = document;
}

} // namespace graphics
