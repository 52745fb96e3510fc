#include "graphics/documents/GraphicDocument.h"

#include "graphics/elements/GraphicMirror.h"

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

} // namespace graphics
