// The printed items that targets consist of.
#pragma once

#include "ced/TargetType.h"
#include "graphics/geometry/Geometry.h"

#include <vector>

namespace ced {

enum class ItemType { dvdCase = 0, booklet, slimCase, jewelCaseFront, jewelCaseBack, disc, bluRayCase };

inline constexpr int kItemTypeCount = 7;

// The name of the type in files; "unknown" for other values.
GRAPHICS_API std::string ItemTypeToXml(ItemType type);
GRAPHICS_API std::optional<ItemType> ItemTypeFromXml(std::string_view text);
// Localised.
GRAPHICS_API std::string ItemTypeToStr(ItemType type);

// In the order in which they are printed.
GRAPHICS_API std::vector<ItemType> getItemTypes(TargetType target);
// Booklets, slim cases and fronts of jewel cases can be folded sheets.
GRAPHICS_API bool isFoldable(ItemType type);
// Millimetres, of an item whose format says nothing else. Folded ones have twice the width.
GRAPHICS_API graphics::SSize getDefaultSize(ItemType type, bool isFolded = false);

} // namespace ced
