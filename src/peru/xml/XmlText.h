// Text on its way into XML and out of it.
#pragma once

#include "peru/strings/String.h"

namespace peru {

// Bytes of the well-formed UTF-8 sequence at the start of the text that XML may hold; 0 where there is none.
// Strict where the UTF-8 of strings is not, and complete: it takes every code point that XML has.
PERU_API size_t measureXmlCharacter(std::string_view text);

namespace xml {

bool isNameStart(char byte);
bool isNamePart(char byte);
bool isBlank(char byte); // white space of XML

// Of well-formed UTF-8. Where the UTF-8 of strings would refuse characters the string is in UTF-16.
P<IString> toString(std::string_view utf8);
// The UTF-8 form. Throws CInvalidArgError for text that XML cannot hold, or that is no name; `method` goes
// into the message.
std::string fromText(const CStringArg& text, const char* method);
std::string fromName(const CStringArg& name, const char* method);

// UTF-16 bytes as UTF-8; false for lone surrogates and half units, with what came before them in `out`.
bool decodeUTF16(std::string_view bytes, bool bigEndian, std::string& out);
std::string decodeLatin1(std::string_view bytes);
std::string encodeUTF16(std::string_view utf8); // little-endian, without a mark

} // namespace xml

} // namespace peru
