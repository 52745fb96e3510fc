// Conversion of text to and from XML.
#pragma once

#include "peru/strings/String.h"

namespace peru {

// Size in bytes of the UTF-8 character at the start of the text; 0 if it is malformed (see UTF8.h) or not
// allowed in XML.
PERU_API size_t measureXmlCharacter(std::string_view text);

namespace xml {

inline constexpr std::string_view kMark = "\xEF\xBB\xBF"; // the byte order mark, U+FEFF

// The first byte of a name, and the bytes after it.
bool isNameStart(char byte);
bool isNamePart(char byte);
// Whether a name can start here. It cannot start with U+FEFF, which the parser skips as white space.
bool startsName(std::string_view text);
bool isBlank(char byte); // XML white space

// Both return UTF-8 and throw CInvalidArgError for text that XML cannot hold, fromName also for an invalid
// name. `method` appears in the message.
std::string fromText(const CStringArg& text, const char* method);
std::string fromName(const CStringArg& name, const char* method);

// Converts UTF-16 bytes to UTF-8. Returns false at an unpaired surrogate or half a unit; `out` then has the
// text before it.
bool decodeUTF16(std::string_view bytes, bool bigEndian, std::string& out);
std::string decodeLatin1(std::string_view bytes);
std::string encodeUTF16(std::string_view utf8); // little-endian, without a mark

} // namespace xml

} // namespace peru
