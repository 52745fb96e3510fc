// Elements without much logic of their own.
#pragma once

#include "graphics/elements/Appearance.h"
#include "graphics/elements/GraphicElement.h"

namespace graphics {

// The sheet below a design, with a shadow.
class GRAPHICS_API CGraphicPaper : public CGraphicElement {
public:
    CGraphicPaper();
    ~CGraphicPaper() override = default;

    P<CGraphicElement> Clone() const override;
    GraphicElementType GetType() const override { return GraphicElementType::paper; }

protected:
    void PaintContent(CPaintContext& context) const override;
};

// One vertex of a free form; paints nothing.
class GRAPHICS_API CGraphicPoint : public CGraphicElement {
public:
    CGraphicPoint() = default;
    ~CGraphicPoint() override = default;

    P<CGraphicElement> Clone() const override;
    GraphicElementType GetType() const override { return GraphicElementType::point; }
};

// A place without content; paints nothing.
class GRAPHICS_API CGraphicDummy : public CGraphicElement {
public:
    CGraphicDummy() = default;
    ~CGraphicDummy() override = default;

    P<CGraphicElement> Clone() const override;
    GraphicElementType GetType() const override { return GraphicElementType::dummy; }
};

// An area with a brush and a pen.
class GRAPHICS_API CGraphicFilled : public CGraphicElement {
protected:
    CGraphicFilled() = default;
    ~CGraphicFilled() override = default;

public:
    void Assign(const CGraphicElement& other) override;
    double GetOverhang() const override;
    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const override;
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) override;

    const SBrush& GetBrush() const { return m_brush; }
    void SetBrush(const SBrush& brush);
    const SPen& GetPen() const { return m_pen; }
    void SetPen(const SPen& pen);

private:
    SBrush m_brush;
    SPen m_pen;
};

// Its diameter is the smaller side of its rectangle.
class GRAPHICS_API CGraphicCircle : public CGraphicFilled {
public:
    CGraphicCircle() = default;
    ~CGraphicCircle() override = default;

    bool ContainsPoint(double x, double y) const override;
    P<CGraphicElement> Clone() const override;
    GraphicElementType GetType() const override { return GraphicElementType::circle; }
    Polygon GetOutline() const override;

protected:
    void PaintContent(CPaintContext& context) const override;

private:
    SRect GetCircleRect() const;
};

class GRAPHICS_API CGraphicRectangle : public CGraphicFilled {
public:
    CGraphicRectangle() = default;
    ~CGraphicRectangle() override = default;

    P<CGraphicElement> Clone() const override;
    GraphicElementType GetType() const override { return GraphicElementType::rectangle; }

protected:
    void PaintContent(CPaintContext& context) const override;
};

class GRAPHICS_API CGraphicStateButton : public CGraphicElement {
public:
    CGraphicStateButton() = default;
    ~CGraphicStateButton() override = default;

    P<CGraphicElement> Clone() const override;
    void Assign(const CGraphicElement& other) override;
    GraphicElementType GetType() const override { return GraphicElementType::stateButton; }
    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const override;
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) override;

    const std::string& GetLabel() const { return m_label; }
    void SetLabel(const std::string& label);
    const std::string& GetButtonHint() const { return m_buttonHint; }
    void SetButtonHint(const std::string& hint) { m_buttonHint = hint; }

protected:
    void PaintContent(CPaintContext& context) const override;

private:
    std::string m_label;
    std::string m_buttonHint;
};

// A line of plain text.
class GRAPHICS_API CGraphicLabel : public CGraphicElement {
public:
    CGraphicLabel() = default;
    ~CGraphicLabel() override = default;

    bool HasResource() const override { return true; }
    P<CGraphicElement> Clone() const override;
    void Assign(const CGraphicElement& other) override;
    GraphicElementType GetType() const override { return GraphicElementType::label; }
    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const override;
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) override;
    void Reset() override { SetText({}); }

    const std::string& GetText() const { return m_text; }
    void SetText(const std::string& text);
    const SFont& GetFont() const { return m_font; }
    void SetFont(const SFont& font);
    const SColour& GetColour() const { return m_colour; }
    void SetColour(const SColour& colour);

protected:
    void PaintContent(CPaintContext& context) const override;

private:
    std::string m_text;
    SFont m_font;
    SColour m_colour;
};

} // namespace graphics
