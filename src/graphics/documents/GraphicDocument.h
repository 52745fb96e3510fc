// A design.
#pragma once

#include "graphics/documents/GraphicContainer.h"

#include <unordered_map>

namespace graphics {

class GRAPHICS_API CGraphicDocument : public CGraphicContainer {
public:
    CGraphicDocument() = default;
    ~CGraphicDocument() override = default;

    // From an original element to its clone.
    using CloneMap = std::unordered_map<const CGraphicElement*, P<CGraphicElement>>;

    // Clones all elements. A mirror that shows elements of this document shows their clones in the new one.
    P<CGraphicDocument> Clone() const;

    // Into and from a node whose name its owner chose. Load() replaces the content; it throws CError for an
    // element that cannot be read. Elements of unknown classes are left out with a line in the log.
    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store);
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store);

    // The content box, or the bounding box of a document without one.
    SRect GetSourceBox();
    // Stretches the source box to the target, in the coordinates of the context's matrix.
    void Paint(CPaintContext& context, const SRect& target);
    void Paint(CPaintContext& context, const SRect& target, const GraphicFilter& filter);
};

// A document that masks painting.
class GRAPHICS_API CGraphicDocumentMask : public CGraphicContainer {
public:
    CGraphicDocumentMask() = default;
    ~CGraphicDocumentMask() override = default;
};

} // namespace graphics
