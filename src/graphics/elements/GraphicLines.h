// Elements that two points define.
#pragma once

#include "graphics/elements/Appearance.h"
#include "graphics/elements/GraphicElement.h"

namespace graphics {

// A straight line. The points are in model space, before rotation; moving or resizing the element moves them.
class GRAPHICS_API CGraphicLine : public CGraphicElement {
public:
    CGraphicLine() = default;
    ~CGraphicLine() override = default;

    void SetCenter(double x, double y) override;
    void SetSize(double width, double height) override;
    bool IsDefinedByPoints() const override { return true; }
    P<CGraphicElement> Clone() const override;
    void Assign(const CGraphicElement& other) override;
    GraphicElementType GetType() const override { return GraphicElementType::line; }
    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const override;
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) override;
    double GetOverhang() const override;

    SPoint GetStart() const { return m_start; }
    SPoint GetEnd() const { return m_end; }
    // Sets center and size.
    void SetLine(SPoint start, SPoint end);
    const SPen& GetPen() const { return m_pen; }
    void SetPen(const SPen& pen);

protected:
    void PaintContent(CPaintContext& context) const override;
    // In local coordinates.
    SPoint GetLocalStart() const;
    SPoint GetLocalEnd() const;

private:
    SPoint m_start;
    SPoint m_end;
    SPen m_pen;
};

// A line with a filled head at its end.
class GRAPHICS_API CGraphicArrow : public CGraphicLine {
public:
    CGraphicArrow() = default;
    ~CGraphicArrow() override = default;

    P<CGraphicElement> Clone() const override;
    GraphicElementType GetType() const override { return GraphicElementType::arrow; }
    double GetOverhang() const override;

    // Tip and two corners, in local coordinates; empty for an arrow without length.
    Polygon GetHead() const;

protected:
    void PaintContent(CPaintContext& context) const override;

private:
    double GetHeadLength() const;
};

// A measuring line: a line with a bar across each end.
class GRAPHICS_API CGraphicDimension : public CGraphicLine {
public:
    CGraphicDimension() = default;
    ~CGraphicDimension() override = default;

    P<CGraphicElement> Clone() const override;
    GraphicElementType GetType() const override { return GraphicElementType::dimension; }
    double GetOverhang() const override;

protected:
    void PaintContent(CPaintContext& context) const override;
};

} // namespace graphics
