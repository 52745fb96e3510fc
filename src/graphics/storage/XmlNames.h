// Free texts as names of XML elements.
#pragma once

#include "graphics/Api.h"

#include <string>

namespace graphics {

// Names that XML accepts remain as they are, unless they look encoded. In others each byte that a name cannot
// have becomes its number between "__", and a name that cannot start with its first byte gets the prefix
// "__L__". decodeName() restores every text.
GRAPHICS_API std::string encodeName(const std::string& text);
GRAPHICS_API std::string decodeName(const std::string& name);

} // namespace graphics
