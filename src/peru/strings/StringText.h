// Shared by the string operations: properties of encoded text, typed access and re-encoding.
#pragma once

#include "peru/strings/CharEncodingRules.h"
#include "peru/strings/IString.h"
#include "peru/strings/StringScan.h"

#include <algorithm>
#include <utility>

namespace peru::text {

// Bytes per character if every character is one code unit and none is malformed, otherwise 0. Needs a counted
// length.
inline int32_t getFixedWidth(const SStringView& view) {
    int32_t unit = getUnitSize(view.encodingId);
    return unit != 0 && view.length * unit == view.byteSize ? unit : 0;
}

// Calls `f` with the units of a fixed-width text.
template <class F> decltype(auto) withUnits(const SStringView& view, int32_t width, F&& f) {
    switch (width) {
    case 1:
        return f(SUnits<uint8_t>{view.data});
    case 2:
        return f(SUnits<uint16_t>{view.data});
    default:
        return f(SUnits<uint32_t>{view.data});
    }
}

// Calls `f` with the rules of the encoding; returns false for the code page, which has none.
template <class F> bool withRules(uint32_t encodingId, F&& f) {
    switch (encodingId) {
    case ICharEncoding::kUTF8:
        f(SUTF8Rules());
        return true;
    case ICharEncoding::kUTF16:
        f(SUTF16Rules());
        return true;
    case ICharEncoding::kUTF32:
        f(SUTF32Rules());
        return true;
    case ICharEncoding::kLatin1:
        f(SLatin1Rules());
        return true;
    }
    return false;
}

// Fills in length and wellFormed.
void count(SStringView& view);

// Byte offset of the character at `index`, from 0 to the length; the byte size for the length itself. Needs a
// counted length.
int32_t getOffset(const SStringView& view, int32_t index);
// Number of characters in the first `byteSize` bytes of well-formed text, which must end between characters.
int32_t countWellFormed(const SStringView& view, int32_t byteSize);
// The first `length` characters.
SStringView clip(const SStringView& view, int32_t length);

// Negative, zero or positive by code point. Needs counted lengths.
int compare(const SStringView& a, const SStringView& b);
bool equals(const SStringView& a, const SStringView& b);
int compareIgnoreCase(const SStringView& a, const SStringView& b);
bool startsWith(const SStringView& text, const SStringView& prefix);
// IString::getHash of the text.
uint32_t getHash(const SStringView& view);

// Bytes that the text needs in another encoding, -1 if a character cannot be encoded there. Needs a counted
// length. Malformed bytes need none, except that malformed UTF-8 counts as unencodable in Latin-1, so that an
// edit produces UTF-8, which keeps the bytes.
int64_t getEncodedSize(const ICharEncoding& encoding, const SStringView& text);
// Writes getEncodedSize() bytes.
void encode(const ICharEncoding& encoding, const SStringView& text, uint8_t* out);

// Returns the text in another encoding as a new, terminated string; `substitute` replaces characters that
// cannot be encoded.
P<IString> convert(const P<ICharEncoding>& encoding, const SStringView& text, char32_t substitute);

char32_t toLower(char32_t ch);
char32_t toUpper(char32_t ch);
bool isWhiteSpace(char32_t ch);

} // namespace peru::text
