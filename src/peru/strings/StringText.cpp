#include "peru/strings/StringText.h"

#include "peru/strings/String.h"
#include "peru/strings/StringWindow.h"

#include <climits>
#include <cstdlib>
#include <new>

namespace peru::text {

namespace {

// Skips the blocks from `pos` on in which every unit is a character; returns the position after them.
template <class Rules> int32_t skipPlainBlocks(const uint8_t* data, int32_t byteSize, int32_t pos) {
    if constexpr (std::is_same_v<Rules, SUTF8Rules>) {
        uint64_t block;
        for (; byteSize - pos >= 8; pos += 8) {
            std::memcpy(&block, data + pos, 8);
            if (block & 0x8080808080808080) break;
        }
    } else if constexpr (std::is_same_v<Rules, SUTF16Rules>) {
        for (; byteSize - pos >= kScanBlock * 2; pos += kScanBlock * 2)
            if (hasAny(SUnits<uint16_t>{data + pos}, kScanBlock,
                       [](uint16_t u) { return (u & 0xF800) == 0xD800; }))
                break;
    } else if constexpr (std::is_same_v<Rules, SUTF32Rules>) {
        for (; byteSize - pos >= kScanBlock * 4; pos += kScanBlock * 4)
            if (hasAny(SUnits<uint32_t>{data + pos}, kScanBlock,
                       [](uint32_t u) { return u > kMaxCodePoint; }))
                break;
    }
    return pos;
}

// The over-long forms that the decoder accepts (U+0040 to U+007F after 0xC1) give one text two spellings, so
// text with them does not count as well-formed.
template <class Rules> void countBy(SStringView& view) {
    int32_t count = 0;
    bool wellFormed = true;
    char32_t ignored;
    for (int32_t pos = 0; pos < view.byteSize;) {
        int32_t next = skipPlainBlocks<Rules>(view.data, view.byteSize, pos);
        count += (next - pos) / Rules::kUnit;
        // The unit that stopped the blocks is near: single steps over a whole block cost less than retrying
        // the block scan after each step.
        int32_t stop = std::min(next + kScanBlock, view.byteSize);
        for (pos = next; pos < stop;) {
            if constexpr (std::is_same_v<Rules, SUTF8Rules>) wellFormed &= view.data[pos] != 0xC1;
            int32_t length = Rules::decode(view.data + pos, view.byteSize - pos, ignored);
            count += length > 0;
            wellFormed &= length > 0;
            pos += length > 0 ? length : Rules::kUnit;
        }
    }
    view.length = count;
    view.wellFormed = wellFormed;
}

// Calls `f` with each character until it returns false.
template <class F> void forEach(const SStringView& text, F&& f) {
    bool known = withRules(text.encodingId, [&](auto rules) {
        using Rules = decltype(rules);
        char32_t ch;
        for (int32_t pos = 0; pos < text.byteSize;) {
            int32_t length = Rules::decode(text.data + pos, text.byteSize - pos, ch);
            if (length > 0 && !f(ch)) return;
            pos += length > 0 ? length : Rules::kUnit;
        }
    });
    if (known) return;
    CStringWindow window(*text.encoding, text.data, text.byteSize, 0);
    for (char32_t ch; window.next(ch);)
        if (!f(ch)) return;
}

template <class Rules> void encodeBy(const SStringView& text, uint8_t* out) {
    forEach(text, [&](char32_t ch) {
        out += Rules::write(ch, out);
        return true;
    });
}

// The most common conversion; takes eight ASCII characters at a time where possible.
void encodeUTF8AsUTF16(const SStringView& text, uint8_t* out) {
    const uint8_t* data = text.data;
    const uint8_t* end = data + text.byteSize;
    char32_t ch = 0;
    while (data < end) {
        uint64_t block;
        while (end - data >= 8) {
            std::memcpy(&block, data, 8);
            if (block & 0x8080808080808080) break;
            uint16_t units[8];
            for (int i = 0; i < 8; ++i) units[i] = data[i];
            std::memcpy(out, units, 16);
            data += 8;
            out += 16;
        }
        const uint8_t* stop = end - data > 8 ? data + 8 : end;
        while (data < stop) {
            int32_t length = 1;
            if (text.wellFormed && *data < 0xF0) {
                // Counting has validated these characters.
                char32_t lead = *data;
                length = lead < 0x80 ? 1 : lead < 0xE0 ? 2 : 3;
                uint16_t unit = static_cast<uint16_t>(
                    length == 1   ? lead
                    : length == 2 ? (lead & 0x1F) << 6 | (data[1] & 0x3F)
                                  : (lead & 0x0F) << 12 | (data[1] & 0x3F) << 6 | (data[2] & 0x3F));
                std::memcpy(out, &unit, sizeof(unit));
                out += sizeof(unit);
            } else {
                length = SUTF8Rules::decode(data, static_cast<int32_t>(end - data), ch);
                if (length > 0) out += SUTF16Rules::write(ch, out);
            }
            data += length > 0 ? length : 1;
        }
    }
}

int64_t getEncodedSizeBySteps(const ICharEncoding& encoding, const SStringView& text) {
    int64_t total = 0;
    bool known = withRules(encoding.getId(), [&](auto rules) {
        forEach(text, [&](char32_t ch) {
            int32_t size = decltype(rules)::getSize(ch);
            total = size == 0 ? -1 : total + size;
            return size != 0;
        });
    });
    if (known) return total;
    forEach(text, [&](char32_t ch) {
        int32_t size = encoding.getEncodedSize(ch);
        total = size == 0 ? -1 : total + size;
        return size != 0;
    });
    return total;
}

// The size in UTF-16 of well-formed UTF-8; -1 if the text may contain surrogates, which need single steps.
int64_t getUTF16SizeOfUTF8(const SStringView& text) {
    int32_t pairs = 0;
    uint8_t suspect = 0;
    for (int32_t i = 0; i < text.byteSize; ++i) {
        pairs += text.data[i] >= 0xF0;
        suspect |= static_cast<uint8_t>(text.data[i] == 0xED);
    }
    return suspect ? -1 : 2 * (static_cast<int64_t>(text.length) + pairs);
}

// Counts the UTF-8 trail bytes among eight bytes, without the first `counted` ones, which are at the low end
// of the word. A trail byte starts with the bits 10; the product adds up the flags of all bytes.
int32_t countTrailsOfWord(const uint8_t* data, int32_t counted) {
    constexpr uint64_t kLowBits = 0x0101010101010101;
    uint64_t word;
    std::memcpy(&word, data, sizeof(word));
    word >>= 8 * counted;
    return static_cast<int32_t>(((word >> 7 & ~(word >> 6) & kLowBits) * kLowBits) >> 56);
}

// The same for any number of bytes. Blocks use byte-wide counters, so that a vector lane is a byte.
int32_t countTrails(const uint8_t* data, int32_t byteSize) {
    int32_t count = 0;
    int32_t i = 0;
    for (; byteSize - i >= kScanBlock; i += kScanBlock) {
        uint8_t trails = 0;
        for (int32_t k = 0; k < kScanBlock; ++k)
            trails = static_cast<uint8_t>(trails + SUTF8Rules::isTrail(data[i + k]));
        count += trails;
    }
    // The rest of a long text, or a whole short one, is counted by words. The last word overlaps the one
    // before it; bytes that are already counted are shifted out.
    if (byteSize < 8) {
        for (; i < byteSize; ++i) count += SUTF8Rules::isTrail(data[i]);
        return count;
    }
    for (; byteSize - i >= 8; i += 8) count += countTrailsOfWord(data + i, 0);
    if (i < byteSize) count += countTrailsOfWord(data + byteSize - 8, 8 - (byteSize - i));
    return count;
}

template <class A, class B> void widen(SUnits<A> from, int32_t count, uint8_t* out) {
    for (int32_t i = 0; i < count; ++i) {
        B unit = static_cast<B>(from[i]);
        std::memcpy(out + static_cast<ptrdiff_t>(i) * static_cast<ptrdiff_t>(sizeof(B)), &unit, sizeof(B));
    }
}

} // namespace

void count(SStringView& view) {
    switch (view.encodingId) {
    case ICharEncoding::kLatin1:
        view.length = view.byteSize;
        view.wellFormed = true;
        break;
    case ICharEncoding::kUTF8:
        countBy<SUTF8Rules>(view);
        break;
    case ICharEncoding::kUTF16:
        countBy<SUTF16Rules>(view);
        break;
    case ICharEncoding::kUTF32:
        countBy<SUTF32Rules>(view);
        break;
    default:
        view.length = view.encoding->countChars(view.data, view.byteSize, 0);
        view.wellFormed = false;
    }
}

int32_t getOffset(const SStringView& view, int32_t index) {
    if (index >= view.length) return view.byteSize;
    if (int32_t width = getFixedWidth(view)) return index * width;
    return view.encoding->advance(view.data, view.byteSize, index);
}

int32_t countWellFormed(const SStringView& view, int32_t byteSize) {
    int32_t count = 0;
    switch (view.encodingId) {
    case ICharEncoding::kUTF8:
        return byteSize - countTrails(view.data, byteSize);
    case ICharEncoding::kUTF16:
        for (int32_t i = 0; i < byteSize / 2; ++i)
            count += !SUTF16Rules::isLow(SUnits<uint16_t>{view.data}[i]);
        return count;
    case ICharEncoding::kUTF32:
        return byteSize / 4;
    default: // Latin-1: text of a code page is never known to be well-formed
        return byteSize;
    }
}

SStringView clip(const SStringView& view, int32_t length) {
    if (length < 0 || view.length <= length) return view;
    SStringView result = view;
    result.byteSize = getOffset(view, length);
    result.length = length;
    return result;
}

int64_t getEncodedSize(const ICharEncoding& encoding, const SStringView& text) {
    uint32_t to = encoding.getId();
    if (to == text.encodingId && text.wellFormed) return text.byteSize;
    if (to == ICharEncoding::kLatin1 && text.encodingId == ICharEncoding::kUTF8 && !text.wellFormed)
        return -1;
    int32_t width = getFixedWidth(text);
    if (width == 1 && to != ICharEncoding::kCodePage) {
        if (to == ICharEncoding::kLatin1) return text.byteSize;
        if (to != ICharEncoding::kUTF8) return static_cast<int64_t>(text.length) * getUnitSize(to);
        if (text.encodingId == ICharEncoding::kUTF8) return text.byteSize;
        int32_t high = 0;
        for (int32_t i = 0; i < text.byteSize; ++i) high += text.data[i] >> 7;
        return static_cast<int64_t>(text.byteSize) + high;
    }
    if (text.wellFormed && to == ICharEncoding::kUTF32) return static_cast<int64_t>(text.length) * 4;
    if (text.wellFormed && to == ICharEncoding::kUTF16 && text.encodingId == ICharEncoding::kUTF8)
        if (int64_t size = getUTF16SizeOfUTF8(text); size >= 0) return size;
    return getEncodedSizeBySteps(encoding, text);
}

void encode(const ICharEncoding& encoding, const SStringView& text, uint8_t* out) {
    uint32_t to = encoding.getId();
    if (to == text.encodingId && text.wellFormed) {
        if (text.byteSize > 0) std::memcpy(out, text.data, static_cast<size_t>(text.byteSize));
        return;
    }
    if (getFixedWidth(text) == 1) {
        SUnits<uint8_t> units{text.data};
        if (to == ICharEncoding::kUTF16) return widen<uint8_t, uint16_t>(units, text.length, out);
        if (to == ICharEncoding::kUTF32) return widen<uint8_t, uint32_t>(units, text.length, out);
        if (to == ICharEncoding::kLatin1) return widen<uint8_t, uint8_t>(units, text.length, out);
    }
    if (to == ICharEncoding::kUTF16 && text.encodingId == ICharEncoding::kUTF8)
        return encodeUTF8AsUTF16(text, out);
    if (withRules(to, [&](auto rules) { encodeBy<decltype(rules)>(text, out); })) return;
    CStringWindow window(*text.encoding, text.data, text.byteSize, 0);
    int32_t pos = 0;
    for (char32_t ch; window.next(ch);) pos = encoding.encodeChar(ch, out, INT_MAX, pos);
}

P<IString> convert(const P<ICharEncoding>& encoding, const SStringView& text, char32_t substitute) {
    int64_t size = getEncodedSize(*encoding, text);
    if (size >= 0) {
        P<CString> string = CString::reserve(*encoding, size);
        encode(*encoding, text, string->getRoom());
        // Only UTF-8 writes characters that it does not read back.
        bool known = text.length >= 0 && getUnitSize(encoding->getId()) != 0 &&
                     (encoding->getId() != ICharEncoding::kUTF8 || size == text.length);
        string->settle(known ? text.length : -1, known);
        return string;
    }
    size = 0;
    int32_t substituteSize = encoding->getEncodedSize(substitute);
    char32_t ch;
    for (CStringWindow window(*text.encoding, text.data, text.byteSize, 0); window.next(ch);) {
        int32_t needed = encoding->getEncodedSize(ch);
        size += needed > 0 ? needed : substituteSize;
    }
    P<CString> string = CString::reserve(*encoding, size);
    uint8_t* block = string->getRoom();
    int32_t pos = 0;
    for (CStringWindow window(*text.encoding, text.data, text.byteSize, 0); window.next(ch);) {
        int32_t next = encoding->encodeChar(ch, block, static_cast<int32_t>(size), pos);
        pos = next > pos ? next : encoding->encodeChar(substitute, block, static_cast<int32_t>(size), pos);
    }
    string->settle();
    return string;
}

} // namespace peru::text
