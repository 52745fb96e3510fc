// Escaping in URIs: %XX for bytes that a part must not contain literally.
#pragma once

#include <string>
#include <string_view>

namespace peru::uri {

enum class EPercent { escape, keepEscapes }; // how an existing "%XX" is treated

// Returns ASCII. Letters, digits, the marks -_.!~*'() and `keptCharacters` stay unescaped.
std::string escapeBytes(std::string_view bytes, std::string_view keptCharacters, EPercent percent);
// For parts that are otherwise kept as written: escapes only the bytes outside printable ASCII.
std::string escapeUnprintable(std::string_view bytes);
// A "%" that does not start an escape is kept.
std::string unescapeBytes(std::string_view text);

} // namespace peru::uri
