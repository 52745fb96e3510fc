// Bytes as hexadecimal text.
#pragma once

#include "peru/strings/String.h"

#include <vector>

namespace peru {

// Two digits per byte in either case, without separators. Throws CParseError with "Error parsing hex data.".
PERU_API std::vector<uint8_t> parseHexData(const CStringArg& text);
PERU_API P<IString> formatHexData(const void* data, int64_t size); // upper case

} // namespace peru
