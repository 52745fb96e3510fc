// The kinds of elements and their names.
#pragma once

#include "graphics/Api.h"

#include <string>
#include <string_view>

namespace graphics {

// The values order the operands of CGraphicElement::Intersects().
enum class GraphicElementType {
    base = 0,
    paper,
    image,
    text,
    textCircle,
    table,
    line,
    point,
    circle,
    rectangle,
    shape,
    arrow,
    dimension,
    custom, // a class outside of graphics, created by an IGraphicElementFactory
    dummy,
    stateButton,
    animation,
    mirror,
    label,
};

inline constexpr int kGraphicElementTypeCount = 19;

// Throws CError for an unknown value.
GRAPHICS_API std::string GraphicTypeToXml(GraphicElementType type);
// Throws CError for an unknown tag.
GRAPHICS_API GraphicElementType GraphicTypeFromXml(std::string_view tag);
GRAPHICS_API bool IsGraphicTypeTag(std::string_view tag);
// Localised, "Unknown" for types that users do not see.
GRAPHICS_API std::string GetGraphicTypeName(GraphicElementType type);

} // namespace graphics
