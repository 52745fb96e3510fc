#include "graphics/documents/GraphicContainer.h"

#include "peru/Errors.h"
#include "peru/strings/StringFormat.h"

namespace graphics {

CGraphicContainer::~CGraphicContainer() {
    for (const auto& element : m_elements) element->RemoveListener(this);
}

void CGraphicContainer::OnGraphicChanged(CGraphicBase&) {
    InvalidateBoundingBox();
}

void CGraphicContainer::BeginUpdate() {
    ++m_updateCount;
}

void CGraphicContainer::EndUpdate() {
    if (--m_updateCount > 0) return;
    m_updateCount = 0;
    InvalidateBoundingBox();
}

void CGraphicContainer::UpdateBoundingBox() {
    m_boundingBox = {};
    for (size_t i = 0; i < m_elements.size(); ++i) {
        const CGraphicElement& element = *m_elements[i];
        const SRect box = element.GetPlacementMatrix().getBounds(SRect::fromCenter({}, element.GetSize()));
        m_boundingBox = i == 0 ? box : m_boundingBox.united(box);
    }
    m_isBoundingBoxValid = true;
}

void CGraphicContainer::Clear() {
    for (const auto& element : m_elements) element->RemoveListener(this);
    m_elements.clear();
    m_contentBox.reset();
    InvalidateBoundingBox();
}

void CGraphicContainer::PaintElements(CPaintContext& context) const {
    PaintElements(context, {});
}

void CGraphicContainer::PaintElements(CPaintContext& context, const GraphicFilter& filter) const {
    for (const auto& element : m_elements)
        if (element->IsVisible() && (!filter || filter(*element))) element->Paint(context);
}

const SRect& CGraphicContainer::GetBoundingBox() {
    if (!m_isBoundingBoxValid && m_updateCount == 0) UpdateBoundingBox();
    return m_boundingBox;
}

const P<CGraphicElement>& CGraphicContainer::GetElement(int index) const {
    if (index < 0 || index >= GetCount())
        throw peru::CInvalidArgError(peru::format("index %d of %d", index, GetCount()), "GetElement");
    return m_elements[static_cast<size_t>(index)];
}

void CGraphicContainer::Add(const P<CGraphicElement>& element) {
    Insert(GetCount(), element);
}

void CGraphicContainer::Insert(int index, const P<CGraphicElement>& element) {
    if (!element || index < 0 || index > GetCount())
        throw peru::CInvalidArgError(element ? "index" : "element", "Insert");
    // A linear search for each addition would make loading a document quadratic, so ask the element.
    if (element->HasListener(this)) throw peru::CInvalidArgError("element is already in the list", "Insert");
    m_elements.insert(m_elements.begin() + index, element);
    element->AddListener(this);
    InvalidateBoundingBox();
}

bool CGraphicContainer::Remove(const P<CGraphicElement>& element) {
    const int index = IndexOf(element);
    if (index < 0) return false;
    const P<CGraphicElement> removed = element; // the argument may be the list's own handle
    m_elements.erase(m_elements.begin() + index);
    removed->RemoveListener(this);
    InvalidateBoundingBox();
    return true;
}

int CGraphicContainer::IndexOf(const P<CGraphicElement>& element) const {
    const auto found = std::find(m_elements.begin(), m_elements.end(), element);
    return found == m_elements.end() ? -1 : static_cast<int>(found - m_elements.begin());
}

void CGraphicContainer::MoveToTop(const P<CGraphicElement>& element) {
    Move(element, GetCount() - 1);
}

void CGraphicContainer::MoveToBottom(const P<CGraphicElement>& element) {
    Move(element, 0);
}

void CGraphicContainer::Move(const P<CGraphicElement>& element, int index) {
    const int old = IndexOf(element);
    if (old < 0) throw peru::CInvalidArgError("element is not in the list", "Move");
    const P<CGraphicElement> moved = element;
    m_elements.erase(m_elements.begin() + old);
    m_elements.insert(m_elements.begin() + index, moved);
    InvalidateBoundingBox();
}

P<CGraphicElement> CGraphicContainer::FindAt(double x, double y) const {
    const auto found = std::find_if(m_elements.rbegin(), m_elements.rend(), [&](const auto& element) {
        return element->IsVisible() && element->ContainsPoint(x, y);
    });
    return found == m_elements.rend() ? P<CGraphicElement>() : *found;
}

} // namespace graphics
