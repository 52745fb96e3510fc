#include "graphics/documents/GraphicDocument.h"

#include "graphics/elements/GraphicMirror.h"
#include "graphics/painting/PaintContext.h"

namespace graphics {

P<CGraphicDocument> CGraphicDocument::Clone() const {
    auto copy = peru::make<CGraphicDocument>();
    copy->SetContentBox(GetContentBox());
    if (GetXDatas()) copy->SetXDatas(GetXDatas()->Clone());
    CloneMap clones;
    copy->BeginUpdate();
    for (const auto& element : GetElements()) {
        const P<CGraphicElement> clone = element->Clone();
        clones.emplace(element.get(), clone);
        copy->Add(clone);
    }
    for (const auto& element : GetElements()) {
        const auto* const mirror = dynamic_cast<const CGraphicMirror*>(element.get());
        if (!mirror || !mirror->GetDocument()) continue;
        const CGraphicMirror& newMirror = dynamic_cast<const CGraphicMirror&>(*clones.at(element.get()));
        // The mirror's own clone has fresh inner elements; those that the document shares are replaced.
        CGraphicDocument& inner = *newMirror.GetDocument();
        for (int i = 0; i < inner.GetCount(); ++i) {
            const auto shared = clones.find(mirror->GetDocument()->GetElement(i).get());
            if (shared == clones.end()) continue;
            inner.Remove(inner.GetElement(i));
            inner.Insert(i, shared->second);
        }
    }
    copy->EndUpdate();
    return copy;
}

SRect CGraphicDocument::GetSourceBox() {
    return GetContentBox() ? *GetContentBox() : GetBoundingBox();
}

void CGraphicDocument::Paint(CPaintContext& context, const SRect& target) {
    Paint(context, target, {});
}

void CGraphicDocument::Paint(CPaintContext& context, const SRect& target, const GraphicFilter& filter) {
    const SRect source = GetSourceBox();
    if (source.width == 0 || source.height == 0) return;
    const SPoint from = source.getCenter(), to = target.getCenter();
    const CPaintContext::CScope scope(
        context, CMatrix::translation(to.x, to.y) *
                     CMatrix::scaling(target.width / source.width, target.height / source.height) *
                     CMatrix::translation(-from.x, -from.y));
    PaintElements(context, filter);
}

} // namespace graphics
