#include "peru/strings/CharEncodings.h"

#include "peru/Errors.h"
#include "peru/strings/RuntimeLocale.h"

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <cwchar>

namespace peru {

namespace {

// The runtime's conversions use the current locale of the thread.
class CCodePageScope : public CLocaleScope {
public:
    CCodePageScope() : CLocaleScope(getCodePageLocale()) {}
};

// Byte length of the character at `p`, 0 if it is malformed or truncated.
int32_t decodeMultiByte(const uint8_t* p, int32_t left, char32_t& out) {
    if (left <= 0) return 0;
    wchar_t wide = 0;
    std::mbstate_t state{};
    size_t length = std::mbrtowc(&wide, reinterpret_cast<const char*>(p), static_cast<size_t>(left), &state);
    if (length == static_cast<size_t>(-1) || length == static_cast<size_t>(-2)) return 0;
    // The runtime's UTF-8 goes beyond Unicode.
    if (static_cast<char32_t>(wide) > kMaxCodePoint) return 0;
    out = static_cast<char32_t>(wide);
    return length == 0 ? 1 : static_cast<int32_t>(length);
}

int32_t encodeMultiByte(char32_t ch, char (&bytes)[MB_LEN_MAX]) {
    if (ch > kMaxCodePoint) return 0;
    std::mbstate_t state{};
    size_t length = std::wcrtomb(bytes, static_cast<wchar_t>(ch), &state);
    return length == static_cast<size_t>(-1) ? 0 : static_cast<int32_t>(length);
}

} // namespace

int32_t CCPCharEncoding::getMaxCharSize() const {
    const CCodePageScope scope;
    return static_cast<int32_t>(MB_CUR_MAX);
}

int32_t CCPCharEncoding::encodeChar(char32_t ch, uint8_t* buffer, int32_t size, int32_t pos) const {
    const CCodePageScope scope;
    char bytes[MB_LEN_MAX];
    int32_t length = encodeMultiByte(ch, bytes);
    if (length == 0 || pos < 0 || length > size - pos) return pos;
    std::memcpy(buffer + pos, bytes, static_cast<size_t>(length));
    return pos + length;
}

int32_t CCPCharEncoding::getEncodedSize(char32_t ch) const {
    const CCodePageScope scope;
    char bytes[MB_LEN_MAX];
    return encodeMultiByte(ch, bytes);
}

int32_t CCPCharEncoding::getCharSizeAt(const uint8_t* buffer, int32_t size, int32_t pos) const {
    const CCodePageScope scope;
    char32_t ignored;
    int32_t length = pos < 0 ? 0 : decodeMultiByte(buffer + pos, size - pos, ignored);
    return length > 0 ? length : -1;
}

int32_t CCPCharEncoding::countChars(const uint8_t* buffer, int32_t size, int32_t pos) const {
    const CCodePageScope scope;
    int32_t count = 0;
    char32_t ignored;
    for (pos = std::max(pos, 0); pos < size;) {
        int32_t length = decodeMultiByte(buffer + pos, size - pos, ignored);
        count += length > 0;
        pos += std::max(length, 1);
    }
    return count;
}

int32_t CCPCharEncoding::getTerminatedLength(const uint8_t* buffer) const {
    return static_cast<int32_t>(std::strlen(reinterpret_cast<const char*>(buffer)));
}

int32_t CCPCharEncoding::advance(const uint8_t* buffer, int32_t size, int32_t count) const {
    const CCodePageScope scope;
    if (count < 0) return -1;
    char32_t ignored;
    for (int32_t pos = 0; pos < size;) {
        int32_t length = decodeMultiByte(buffer + pos, size - pos, ignored);
        if (length > 0 && count-- == 0) return pos;
        pos += std::max(length, 1);
    }
    return -1;
}

int32_t CCPCharEncoding::findValidChar(const uint8_t* buffer, int32_t size, int32_t pos) const {
    const CCodePageScope scope;
    char32_t ignored;
    for (pos = std::max(pos, 0); pos < size; ++pos)
        if (decodeMultiByte(buffer + pos, size - pos, ignored) > 0) return pos;
    return -1;
}

int32_t CCPCharEncoding::decodeChar(char32_t& out, const uint8_t* buffer, int32_t size, int32_t pos) const {
    const CCodePageScope scope;
    int32_t length = pos < 0 ? 0 : decodeMultiByte(buffer + pos, size - pos, out);
    return length > 0 ? pos + length : -1;
}

int32_t CCPCharEncoding::decodeNextChar(char32_t& out, const uint8_t* buffer, int32_t size,
                                        int32_t pos) const {
    const CCodePageScope scope;
    for (pos = std::max(pos, 0); pos < size; ++pos)
        if (int32_t length = decodeMultiByte(buffer + pos, size - pos, out)) return pos + length;
    return -1;
}

int32_t CCPCharEncoding::decodeChars(char32_t* out, int32_t maxCount, int32_t& outCount,
                                     const uint8_t* buffer, int32_t size, int32_t pos,
                                     int32_t* positions) const {
    const CCodePageScope scope;
    int32_t end = -1;
    outCount = 0;
    for (pos = std::max(pos, 0); pos < size && outCount < maxCount;) {
        int32_t length = decodeMultiByte(buffer + pos, size - pos, out[outCount]);
        if (length == 0) {
            ++pos;
            continue;
        }
        if (positions) positions[outCount] = pos;
        pos += length;
        end = pos;
        ++outCount;
    }
    return end;
}

int32_t CCPCharEncoding::findPrevChar(const uint8_t*, int32_t, int32_t) const {
    throw CMethodNotImplementedError("CCPCharEncoding::findPrevChar");
}

int32_t CCPCharEncoding::decodePrevChar(char32_t&, const uint8_t*, int32_t, int32_t) const {
    throw CMethodNotImplementedError("CCPCharEncoding::decodePrevChar");
}

int32_t CCPCharEncoding::decodePrevValidChar(char32_t&, const uint8_t*, int32_t, int32_t) const {
    throw CMethodNotImplementedError("CCPCharEncoding::decodePrevValidChar");
}

int32_t CCPCharEncoding::decodeCharsBackward(char32_t*, int32_t, int32_t&, const uint8_t*, int32_t, int32_t,
                                             int32_t*) const {
    throw CMethodNotImplementedError("CCPCharEncoding::decodeCharsBackward");
}

} // namespace peru
