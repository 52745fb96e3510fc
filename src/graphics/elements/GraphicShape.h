// A shape with fill and outline.
#pragma once

#include "graphics/elements/BasicElements.h"
#include "graphics/elements/ShapeType.h"

namespace graphics {

class CFreeForm;

class GRAPHICS_API CGraphicShape : public CGraphicFilled {
public:
    CGraphicShape();
    ~CGraphicShape() override;

    P<CGraphicElement> Clone() const override;
    void Assign(const CGraphicElement& other) override;
    GraphicElementType GetType() const override { return GraphicElementType::shape; }
    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const override;
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) override;
    // Empty for a free form that is not set.
    Polygon GetOutline() const override;
    double GetOverhang() const override;

    EShapeType GetShapeType() const { return m_type; }
    void SetShapeType(EShapeType type);
    const SGradient& GetGradient() const { return m_gradient; }
    void SetGradient(const SGradient& gradient);
    // In millimetres, for rounded rectangles.
    double GetCornerRadius() const { return m_cornerRadius; }
    void SetCornerRadius(double radius);
    const P<CFreeForm>& GetFreeForm() const { return m_freeForm; } // may be empty
    void SetFreeForm(const P<CFreeForm>& freeForm);

protected:
    void PaintContent(CPaintContext& context) const override;

private:
    EShapeType m_type = EShapeType::rectangle;
    SGradient m_gradient;
    double m_cornerRadius = 3;
    P<CFreeForm> m_freeForm; // never changed after it was set, so clones share it
};

} // namespace graphics
