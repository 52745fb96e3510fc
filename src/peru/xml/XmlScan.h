// A check of XML text before the parser sees it.
#pragma once

#include <cstdint>
#include <string_view>

namespace peru::xml {

enum class EFault { none, syntax, encoding, limit };

struct SFault {
    EFault kind = EFault::none;
    size_t offset = 0;
};

// Finds, in one pass without recursion, what the parser would misread, drop silently or spend unbounded stack
// or time on: invalid UTF-8, unclosed tags, more levels or attributes than IXmlDocument allows, text and
// elements next to the root, document types with a body, and invalid references, including a lone "&". The
// names of end tags and duplicate attributes are left to the parser.
SFault check(std::string_view text);

// Counted from 1; a carriage return, with or without a line feed, ends a line.
int32_t getLine(std::string_view text, size_t offset);

} // namespace peru::xml
