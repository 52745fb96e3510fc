// Numbers as files hold them: the same in every locale, and exact when they are read again.
#pragma once

#include "graphics/Api.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace graphics {

// The shortest text that reads back to the same bits.
GRAPHICS_API std::string formatNumber(double value);
// Empty unless the whole text is a finite number.
GRAPHICS_API std::optional<double> parseNumber(std::string_view text);
// Empty unless the whole text is a decimal integer in range.
GRAPHICS_API std::optional<int64_t> parseInteger(std::string_view text);

} // namespace graphics
