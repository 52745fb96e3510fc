// Escaped text of URIs: %XX for what a part must not hold as it is.
#pragma once

#include <string>
#include <string_view>

namespace peru::uri {

enum class EPercent { escape, keepEscapes }; // what becomes of a "%XX" that is there already

// Pure ASCII. Letters, digits and the marks -_.!~*'() stay, and so do `keptCharacters`.
std::string escapeBytes(std::string_view bytes, std::string_view keptCharacters, EPercent percent);
// For what is taken as it was written: only bytes that no text line should hold are escaped.
std::string escapeUnprintable(std::string_view bytes);
// A "%" that starts no escape stays.
std::string unescapeBytes(std::string_view text);

} // namespace peru::uri
