// UTF-8 as other programs read and write it.
#pragma once

#include "peru/Api.h"

#include <cstddef>
#include <string>
#include <string_view>

namespace peru {

// Size in bytes of the character at the start of the text, 0 if there is none or it is malformed. Unlike the
// decoder of UTF-8 strings this follows the standard: it rejects surrogates and all over-long forms, and
// accepts every other code point.
PERU_API size_t measureUTF8Character(std::string_view text);

// The code point of a well-formed character of `size` bytes.
char32_t decodeUTF8Character(const char* text, size_t size);

// For display: every byte that is not part of a well-formed character becomes U+FFFD.
PERU_API std::string makeValidUTF8(std::string_view text);

} // namespace peru
