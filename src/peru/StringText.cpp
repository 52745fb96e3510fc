#include "peru/StringText.h"

#include "peru/String.h"
#include "peru/StringWindow.h"

#include <climits>
#include <cstdlib>
#include <new>

namespace peru::text {

namespace {

// Over-long forms that the decoder lets pass (U+0040 to U+007F behind 0xC1) make two spellings of one text,
// so such text does not count as well-formed.
template <class Rules> void countBy(SStringView& view) {
    int32_t count = 0;
    bool wellFormed = true;
    char32_t ignored;
    for (int32_t pos = 0; pos < view.byteSize;) {
        if constexpr (std::is_same_v<Rules, SUTF8Rules>) {
            uint64_t block;
            while (view.byteSize - pos >= 8) {
                std::memcpy(&block, view.data + pos, 8);
                if (block & 0x8080808080808080) break;
                count += 8;
                pos += 8;
            }
            if (pos == view.byteSize) break;
            wellFormed &= view.data[pos] != 0xC1;
        }
        int32_t length = Rules::decode(view.data + pos, view.byteSize - pos, ignored);
        count += length > 0;
        wellFormed &= length > 0;
        pos += length > 0 ? length : Rules::kUnit;
    }
    view.length = count;
    view.wellFormed = wellFormed;
}

template <class Rules> void encodeBy(const SStringView& text, uint8_t* out) {
    CStringWindow window(*text.encoding, text.data, text.byteSize, 0);
    for (char32_t ch; window.next(ch);) out += Rules::write(ch, out);
}

int64_t getEncodedSizeBySteps(const ICharEncoding& encoding, const SStringView& text) {
    CStringWindow window(*text.encoding, text.data, text.byteSize, 0);
    int64_t total = 0;
    for (char32_t ch; window.next(ch);) {
        int32_t size = encoding.getEncodedSize(ch);
        if (size == 0) return -1;
        total += size;
    }
    return total;
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
        for (int32_t i = 0; i < byteSize; ++i) count += !SUTF8Rules::isTrail(view.data[i]);
        return count;
    case ICharEncoding::kUTF16:
        for (int32_t i = 0; i < byteSize / 2; ++i)
            count += !SUTF16Rules::isLow(SUnits<uint16_t>{view.data}[i]);
        return count;
    default:
        return byteSize / getUnitSize(view.encodingId);
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
    switch (to) {
    case ICharEncoding::kUTF8:
        return encodeBy<SUTF8Rules>(text, out);
    case ICharEncoding::kUTF16:
        return encodeBy<SUTF16Rules>(text, out);
    case ICharEncoding::kUTF32:
        return encodeBy<SUTF32Rules>(text, out);
    case ICharEncoding::kLatin1:
        return encodeBy<SLatin1Rules>(text, out);
    }
    CStringWindow window(*text.encoding, text.data, text.byteSize, 0);
    int32_t pos = 0;
    for (char32_t ch; window.next(ch);) pos = encoding.encodeChar(ch, out, INT_MAX, pos);
}

uint8_t* allocate(const ICharEncoding& encoding, int64_t byteSize) {
    int64_t total = byteSize + encoding.getMaxCharSize();
    if (total > INT_MAX) throw std::bad_alloc();
    auto* block = static_cast<uint8_t*>(std::malloc(static_cast<size_t>(total)));
    if (!block) throw std::bad_alloc();
    encoding.encodeChar(0, block, static_cast<int32_t>(total), static_cast<int32_t>(byteSize));
    return block;
}

P<IString> convert(const P<ICharEncoding>& encoding, const SStringView& text, char32_t substitute) {
    int64_t size = getEncodedSize(*encoding, text);
    if (size >= 0) {
        uint8_t* block = allocate(*encoding, size);
        encode(*encoding, text, block);
        return CString::adopt(encoding, block, static_cast<int32_t>(size));
    }
    size = 0;
    int32_t substituteSize = encoding->getEncodedSize(substitute);
    char32_t ch;
    for (CStringWindow window(*text.encoding, text.data, text.byteSize, 0); window.next(ch);) {
        int32_t needed = encoding->getEncodedSize(ch);
        size += needed > 0 ? needed : substituteSize;
    }
    uint8_t* block = allocate(*encoding, size);
    int32_t pos = 0;
    for (CStringWindow window(*text.encoding, text.data, text.byteSize, 0); window.next(ch);) {
        int32_t next = encoding->encodeChar(ch, block, static_cast<int32_t>(size), pos);
        pos = next > pos ? next : encoding->encodeChar(substitute, block, static_cast<int32_t>(size), pos);
    }
    return CString::adopt(encoding, block, static_cast<int32_t>(size));
}

} // namespace peru::text
