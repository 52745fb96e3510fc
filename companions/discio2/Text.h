// UTF-8 inside, UTF-16 at the boundary.
#pragma once

#include <string>
#include <string_view>

namespace discio {

// Bytes that are not UTF-8 become U+DC80 to U+DCFF, so that toUTF8 restores every path.
std::u16string toUTF16(std::string_view utf8);
std::string toUTF8(std::u16string_view utf16);

} // namespace discio
