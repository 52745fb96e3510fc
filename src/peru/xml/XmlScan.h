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

// Finds, in one pass without recursion, what the parser would mistake, drop in silence or spend unbounded
// stack or time on: text that is no UTF-8, tags that do not close, more levels or attributes than
// IXmlDocument allows, text and elements beside the root, document types with a body, bad numeric references.
// A lone "&" passes: the parser takes it as it stands. Names of end tags and double attributes are left to
// the parser.
SFault check(std::string_view text);

// Counted from 1; a carriage return, with or without a line feed, ends a line.
int32_t getLine(std::string_view text, size_t offset);

} // namespace peru::xml
