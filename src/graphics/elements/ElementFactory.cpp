#include "graphics/elements/ElementFactory.h"

#include "graphics/elements/GraphicImage.h"
#include "graphics/elements/GraphicLines.h"
#include "graphics/elements/GraphicMirror.h"
#include "graphics/elements/GraphicShape.h"
#include "graphics/elements/GraphicTable.h"
#include "graphics/elements/GraphicText.h"

namespace graphics {

namespace {

P<IGraphicElementFactory>& getFactory() {
    static P<IGraphicElementFactory> s_factory;
    return s_factory;
}

} // namespace

void setElementFactory(const P<IGraphicElementFactory>& factory) {
    getFactory() = factory;
}

P<CGraphicElement> CreateElement(GraphicElementType type, const std::string& typeName) {
    if (typeName.empty()) return CreateElement(type);
    if (getFactory())
        if (const auto element = getFactory()->CreateElement(typeName)) return element;
    const auto element = CreateElement(type);
    // The name is preserved for a program that knows the class.
    if (element) element->SetTypeName(typeName);
    return element;
}

P<CGraphicElement> CreateElement(GraphicElementType type) {
    switch (type) {
    case GraphicElementType::paper:
        return peru::make<CGraphicPaper>();
    case GraphicElementType::image:
        return peru::make<CGraphicImage>();
    case GraphicElementType::text:
        return peru::make<CGraphicText>();
    case GraphicElementType::textCircle:
        return peru::make<CGraphicTextCircle>();
    case GraphicElementType::table:
        return peru::make<CGraphicTable>();
    case GraphicElementType::line:
        return peru::make<CGraphicLine>();
    case GraphicElementType::point:
        return peru::make<CGraphicPoint>();
    case GraphicElementType::circle:
        return peru::make<CGraphicCircle>();
    case GraphicElementType::rectangle:
        return peru::make<CGraphicRectangle>();
    case GraphicElementType::shape:
        return peru::make<CGraphicShape>();
    case GraphicElementType::arrow:
        return peru::make<CGraphicArrow>();
    case GraphicElementType::dimension:
        return peru::make<CGraphicDimension>();
    case GraphicElementType::dummy:
        return peru::make<CGraphicDummy>();
    case GraphicElementType::stateButton:
        return peru::make<CGraphicStateButton>();
    case GraphicElementType::mirror:
        return peru::make<CGraphicMirror>();
    case GraphicElementType::label:
        return peru::make<CGraphicLabel>();
    default:
        return {};
    }
}

} // namespace graphics
