// The rules of each encoding, shared by the encoding objects and by loops that are compiled for one encoding.
#pragma once

#include "peru/strings/ICharEncoding.h"

#include <cstring>

namespace peru {

inline constexpr char32_t kMaxCodePoint = 0x10FFFF;

// `decode` returns the byte length of the character at `p`, or 0 if it is malformed or exceeds the `left`
// bytes available. `getSize` returns 0 for a code point that cannot be encoded; `write` must not be called
// for one.

struct SUTF8Rules {
    static constexpr uint32_t kId = ICharEncoding::kUTF8;
    static constexpr const char* kName = "UTF-8";
    static constexpr int32_t kUnit = 1;
    static constexpr int32_t kMaxCharSize = 4;
    static constexpr bool kUnicode = true;

    static bool isTrail(uint8_t byte) { return (byte & 0xC0) == 0x80; }

    // A lead byte whose payload bits are all zero is rejected, even where it begins a character that the
    // encoder writes. This guards against over-long forms (those after 0xC1 still pass) and makes U+0800 to
    // U+0FFF and U+10000 to U+3FFFF unreadable.
    static int32_t decode(const uint8_t* p, int32_t left, char32_t& out) {
        if (left <= 0) return 0;
        uint8_t lead = p[0];
        if (lead < 0x80) {
            out = lead;
            return 1;
        }
        if (lead < 0xC1) return 0;
        if (lead < 0xE0) {
            if (left < 2 || !isTrail(p[1])) return 0;
            out = static_cast<char32_t>((lead & 0x1F) << 6 | (p[1] & 0x3F));
            return 2;
        }
        if (lead < 0xF0) {
            if (lead == 0xE0 || left < 3 || !isTrail(p[1]) || !isTrail(p[2])) return 0;
            out = static_cast<char32_t>((lead & 0x0F) << 12 | (p[1] & 0x3F) << 6 | (p[2] & 0x3F));
            return 3;
        }
        if (lead == 0xF0 || lead >= 0xF8 || left < 4 || !isTrail(p[1]) || !isTrail(p[2]) || !isTrail(p[3]))
            return 0;
        char32_t ch = static_cast<char32_t>((lead & 0x07) << 18 | (p[1] & 0x3F) << 12 | (p[2] & 0x3F) << 6 |
                                            (p[3] & 0x3F));
        if (ch > kMaxCodePoint) return 0;
        out = ch;
        return 4;
    }
    static int32_t getSize(char32_t ch) {
        return ch < 0x80 ? 1 : ch < 0x800 ? 2 : ch < 0x10000 ? 3 : ch <= kMaxCodePoint ? 4 : 0;
    }
    static int32_t write(char32_t ch, uint8_t* p) {
        if (ch < 0x80) {
            p[0] = static_cast<uint8_t>(ch);
            return 1;
        }
        if (ch < 0x800) {
            p[0] = static_cast<uint8_t>(0xC0 | ch >> 6);
            p[1] = static_cast<uint8_t>(0x80 | (ch & 0x3F));
            return 2;
        }
        if (ch < 0x10000) {
            p[0] = static_cast<uint8_t>(0xE0 | ch >> 12);
            p[1] = static_cast<uint8_t>(0x80 | (ch >> 6 & 0x3F));
            p[2] = static_cast<uint8_t>(0x80 | (ch & 0x3F));
            return 3;
        }
        p[0] = static_cast<uint8_t>(0xF0 | ch >> 18);
        p[1] = static_cast<uint8_t>(0x80 | (ch >> 12 & 0x3F));
        p[2] = static_cast<uint8_t>(0x80 | (ch >> 6 & 0x3F));
        p[3] = static_cast<uint8_t>(0x80 | (ch & 0x3F));
        return 4;
    }
};

// Native byte order. An unpaired surrogate is malformed, and a surrogate code point cannot be encoded.
struct SUTF16Rules {
    static constexpr uint32_t kId = ICharEncoding::kUTF16;
    static constexpr const char* kName = "UTF-16";
    static constexpr int32_t kUnit = 2;
    static constexpr int32_t kMaxCharSize = 4;
    static constexpr bool kUnicode = true;

    static bool isSurrogate(char32_t ch) { return (ch & 0xFFFFF800) == 0xD800; }
    static bool isHigh(char32_t unit) { return (unit & 0xFC00) == 0xD800; }
    static bool isLow(char32_t unit) { return (unit & 0xFC00) == 0xDC00; }
    static char16_t load(const uint8_t* p) {
        char16_t unit;
        std::memcpy(&unit, p, 2);
        return unit;
    }

    static int32_t decode(const uint8_t* p, int32_t left, char32_t& out) {
        if (left < 2) return 0;
        char32_t unit = load(p);
        if (!isSurrogate(unit)) {
            out = unit;
            return 2;
        }
        if (!isHigh(unit) || left < 4) return 0;
        char32_t low = load(p + 2);
        if (!isLow(low)) return 0;
        out = 0x10000 + ((unit - 0xD800) << 10) + (low - 0xDC00);
        return 4;
    }
    static int32_t getSize(char32_t ch) {
        if (ch < 0x10000) return isSurrogate(ch) ? 0 : 2;
        return ch <= kMaxCodePoint ? 4 : 0;
    }
    static int32_t write(char32_t ch, uint8_t* p) {
        if (ch < 0x10000) {
            char16_t unit = static_cast<char16_t>(ch);
            std::memcpy(p, &unit, 2);
            return 2;
        }
        char16_t pair[2] = {static_cast<char16_t>(0xD800 + ((ch - 0x10000) >> 10)),
                            static_cast<char16_t>(0xDC00 + (ch & 0x3FF))};
        std::memcpy(p, pair, 4);
        return 4;
    }
};

struct SUTF32Rules {
    static constexpr uint32_t kId = ICharEncoding::kUTF32;
    static constexpr const char* kName = "UTF-32";
    static constexpr int32_t kUnit = 4;
    static constexpr int32_t kMaxCharSize = 4;
    static constexpr bool kUnicode = true;

    static int32_t decode(const uint8_t* p, int32_t left, char32_t& out) {
        if (left < 4) return 0;
        char32_t ch;
        std::memcpy(&ch, p, 4);
        if (ch > kMaxCodePoint) return 0;
        out = ch;
        return 4;
    }
    static int32_t getSize(char32_t ch) { return ch <= kMaxCodePoint ? 4 : 0; }
    static int32_t write(char32_t ch, uint8_t* p) {
        std::memcpy(p, &ch, 4);
        return 4;
    }
};

struct SLatin1Rules {
    static constexpr uint32_t kId = ICharEncoding::kLatin1;
    static constexpr const char* kName = "Latin-1";
    static constexpr int32_t kUnit = 1;
    static constexpr int32_t kMaxCharSize = 1;
    static constexpr bool kUnicode = false;

    static int32_t decode(const uint8_t* p, int32_t left, char32_t& out) {
        if (left <= 0) return 0;
        out = *p;
        return 1;
    }
    static int32_t getSize(char32_t ch) { return ch < 0x100 ? 1 : 0; }
    static int32_t write(char32_t ch, uint8_t* p) {
        *p = static_cast<uint8_t>(ch);
        return 1;
    }
};

// Bytes per code unit, 0 for the code page, which has no fixed unit.
constexpr int32_t getUnitSize(uint32_t encodingId) {
    switch (encodingId) {
    case ICharEncoding::kUTF16:
        return 2;
    case ICharEncoding::kUTF32:
        return 4;
    case ICharEncoding::kCodePage:
        return 0;
    default:
        return 1;
    }
}

} // namespace peru
