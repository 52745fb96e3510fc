// The kinds of shapes and their names.
#pragma once

#include "graphics/Api.h"

#include <string>
#include <string_view>

namespace graphics {

enum class EShapeType { rectangle, ellipse, roundedRectangle, freeForm };

inline constexpr int kShapeTypeCount = 4;

// Throws CError for an unknown value.
GRAPHICS_API std::string ShapeTypeToXml(EShapeType type);
// Throws CError for an unknown text.
GRAPHICS_API EShapeType ShapeTypeFromXml(std::string_view text);
// Localised.
GRAPHICS_API std::string GetShapeTypeName(EShapeType type);

} // namespace graphics
