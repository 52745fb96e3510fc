// What a project can have designs for.
#pragma once

#include "graphics/Api.h"

#include <optional>
#include <string>
#include <string_view>

namespace ced {

enum class TargetType { dvdCase = 0, booklet, slimCase, jewelCase, bluRayCase, disc };

inline constexpr int kTargetTypeCount = 6;

// The name of the target's element in files; "unknown" for other values.
GRAPHICS_API std::string TargetTypeToXml(TargetType type);
GRAPHICS_API std::optional<TargetType> TargetTypeFromXml(std::string_view text);
// Localised.
GRAPHICS_API std::string TargetTypeToStr(TargetType type);

} // namespace ced
