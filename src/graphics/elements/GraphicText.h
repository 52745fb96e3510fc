// Rich text in a box and on a circle.
#pragma once

#include "graphics/elements/GraphicElement.h"
#include "graphics/elements/RichText.h"

namespace graphics {

enum class EVerticalPlacement { top = 0, center = 1, bottom = 2 };

class CLayoutCache;

// Rich text in a box. It is the toolkit's rich text buffer in its stored form: see text/RichTextBuffer.h for
// buffers to edit.
class GRAPHICS_API CGraphicText : public CGraphicElement {
public:
    CGraphicText();
    ~CGraphicText() override;

    bool HasResource() const override { return true; }
    std::string GetHint() const override;
    P<CGraphicElement> Clone() const override;
    void Assign(const CGraphicElement& other) override;
    GraphicElementType GetType() const override { return GraphicElementType::text; }
    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const override;
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) override;
    void Reset() override { SetText(nullptr); }

    // Empty, or without a character, if there is no text.
    const P<CRichText>& GetText() const { return m_text; }
    void SetText(const P<CRichText>& text);
    EVerticalPlacement GetVerticalPlacement() const { return m_placement; }
    void SetVerticalPlacement(EVerticalPlacement placement);

protected:
    void PaintContent(CPaintContext& context) const override;

private:
    P<CRichText> m_text;
    mutable std::unique_ptr<CLayoutCache> m_layout; // null before the first painting
    EVerticalPlacement m_placement = EVerticalPlacement::top;
};

enum class ECircleType { concav, convex };

// Throws CError for an unknown value.
GRAPHICS_API std::string CircleTypeToXml(ECircleType type);
// Throws CError for an unknown text.
GRAPHICS_API ECircleType CircleTypeFromXml(std::string_view text);

// Text on the largest circle in its box. Width and height are equal: the smaller value of what is set.
class GRAPHICS_API CGraphicTextCircle : public CGraphicText {
public:
    CGraphicTextCircle() = default;
    ~CGraphicTextCircle() override = default;

    void SetSize(double width, double height) override;
    void SetBoundingSize(double width, double height) override;
    // The circle's box, which does not depend on the rotation.
    SSize GetBoundingSize() const override;
    P<CGraphicElement> Clone() const override;
    void Assign(const CGraphicElement& other) override;
    GraphicElementType GetType() const override { return GraphicElementType::textCircle; }
    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const override;
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) override;

    ECircleType GetCircleType() const { return m_circleType; }
    void SetCircleType(ECircleType type);

protected:
    void PaintContent(CPaintContext& context) const override;

private:
    ECircleType m_circleType = ECircleType::convex;
};

} // namespace graphics
