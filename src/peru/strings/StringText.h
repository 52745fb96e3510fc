// What the string operations share: knowledge about encoded text, typed access, and re-encoding.
#pragma once

#include "peru/strings/CharEncodingRules.h"
#include "peru/strings/IString.h"
#include "peru/strings/StringScan.h"

#include <algorithm>
#include <utility>

namespace peru::text {

// Bytes per character when every character is one code unit and nothing is malformed, else 0. Needs a
// counted length.
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

// Calls `f` with the rules of an encoding that has any; false for the code page.
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

// Byte offset of a character in counted text, `index` from 0 to the length; the byte size for the length.
int32_t getOffset(const SStringView& view, int32_t index);
// Characters in well-formed text before a byte offset at which a character starts.
int32_t countWellFormed(const SStringView& view, int32_t byteSize);
// The first `length` characters.
SStringView clip(const SStringView& view, int32_t length);

// Negative, zero or positive by code point; counted texts.
int compare(const SStringView& a, const SStringView& b);
bool equals(const SStringView& a, const SStringView& b);
int compareIgnoreCase(const SStringView& a, const SStringView& b);
bool startsWith(const SStringView& text, const SStringView& prefix);

// Bytes that counted text needs in another encoding; -1 when a character cannot be encoded there. Malformed
// bytes need none, except that malformed UTF-8 counts as not encodable in Latin-1: an edit then results in
// UTF-8, which carries the bytes on.
int64_t getEncodedSize(const ICharEncoding& encoding, const SStringView& text);
// Writes so many bytes.
void encode(const ICharEncoding& encoding, const SStringView& text, uint8_t* out);

// The text in another encoding as a string of its own, terminated; `substitute` stands for what cannot be
// encoded.
P<IString> convert(const P<ICharEncoding>& encoding, const SStringView& text, char32_t substitute);

char32_t toLower(char32_t ch);
char32_t toUpper(char32_t ch);
bool isWhiteSpace(char32_t ch);

} // namespace peru::text
