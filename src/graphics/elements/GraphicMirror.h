// A faded reflection of other elements.
#pragma once

#include "graphics/elements/GraphicElement.h"

namespace graphics {

class CGraphicDocument;

class GRAPHICS_API CGraphicMirror : public CGraphicElement {
public:
    CGraphicMirror();
    ~CGraphicMirror() override;

    bool HasResource() const override { return true; }
    P<CGraphicElement> Clone() const override;
    // Clones the inner document.
    void Assign(const CGraphicElement& other) override;
    GraphicElementType GetType() const override { return GraphicElementType::mirror; }
    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const override;
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) override;

    const P<CGraphicDocument>& GetDocument() const { return m_document; } // may be empty
    void SetDocument(const P<CGraphicDocument>& document);

protected:
    void PaintContent(CPaintContext& context) const override;

private:
    P<CGraphicDocument> m_document;
};

} // namespace graphics
