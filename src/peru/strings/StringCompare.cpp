// Comparing and hashing.
#include "peru/strings/String.h"
#include "peru/strings/StringText.h"
#include "peru/strings/StringWindow.h"

namespace peru {

namespace text {

namespace {

template <class T> int order(T a, T b) {
    return a < b ? -1 : a > b ? 1 : 0;
}

int compareFixed(const SStringView& a, int32_t widthA, const SStringView& b, int32_t widthB) {
    int32_t common = std::min(a.length, b.length);
    if (widthA == 1 && widthB == 1) {
        int result = std::memcmp(a.data, b.data, static_cast<size_t>(common));
        return result != 0 ? result : order(a.length, b.length);
    }
    return withUnits(a, widthA, [&](auto ua) {
        return withUnits(b, widthB, [&](auto ub) {
            int32_t i = findDifference(ua, ub, common);
            return i < common ? order<uint32_t>(ua[i], ub[i]) : order(a.length, b.length);
        });
    });
}

template <class M> int compareBySteps(const SStringView& a, const SStringView& b, M&& map) {
    CStringWindow windowA(*a.encoding, a.data, a.byteSize, 0);
    CStringWindow windowB(*b.encoding, b.data, b.byteSize, 0);
    for (char32_t ca, cb;;) {
        bool moreA = windowA.next(ca);
        bool moreB = windowB.next(cb);
        if (!moreA || !moreB) return order(moreA, moreB);
        if (ca != cb && map(ca) != map(cb)) return order(map(ca), map(cb));
    }
}

// The same without the window, for encodings with compile-time rules.
template <class A, class B> int compareDecoded(const SStringView& a, const SStringView& b) {
    const uint8_t* endA = a.data + a.byteSize;
    const uint8_t* endB = b.data + b.byteSize;
    const uint8_t* pa = a.data;
    const uint8_t* pb = b.data;
    for (char32_t ca, cb;;) {
        int32_t lengthA = 0;
        int32_t lengthB = 0;
        while (pa < endA && (lengthA = A::decode(pa, static_cast<int32_t>(endA - pa), ca)) == 0)
            pa += A::kUnit;
        while (pb < endB && (lengthB = B::decode(pb, static_cast<int32_t>(endB - pb), cb)) == 0)
            pb += B::kUnit;
        if (lengthA == 0 || lengthB == 0) return order(lengthA != 0, lengthB != 0);
        if (ca != cb) return order(ca, cb);
        pa += lengthA;
        pb += lengthB;
    }
}

bool isSameSpelling(const SStringView& a, const SStringView& b) {
    return a.encodingId == b.encodingId && a.wellFormed && b.wellFormed;
}

} // namespace

int compare(const SStringView& a, const SStringView& b) {
    int32_t widthA = getFixedWidth(a);
    int32_t widthB = getFixedWidth(b);
    if (widthA && widthB) return compareFixed(a, widthA, b, widthB);
    if (a.encodingId == ICharEncoding::kUTF8 && isSameSpelling(a, b)) {
        int result = std::memcmp(a.data, b.data, static_cast<size_t>(std::min(a.byteSize, b.byteSize)));
        return result != 0 ? result : order(a.byteSize, b.byteSize);
    }
    int result = 0;
    bool decoded = false;
    withRules(a.encodingId, [&](auto rulesA) {
        decoded = withRules(b.encodingId, [&](auto rulesB) {
            result = compareDecoded<decltype(rulesA), decltype(rulesB)>(a, b);
        });
    });
    return decoded ? result : compareBySteps(a, b, [](char32_t ch) { return ch; });
}

bool equals(const SStringView& a, const SStringView& b) {
    if (a.length != b.length) return false;
    if (isSameSpelling(a, b))
        return a.byteSize == b.byteSize && std::memcmp(a.data, b.data, static_cast<size_t>(a.byteSize)) == 0;
    return compare(a, b) == 0;
}

int compareIgnoreCase(const SStringView& a, const SStringView& b) {
    return compareBySteps(a, b, toLower);
}

bool startsWith(const SStringView& text, const SStringView& prefix) {
    return prefix.length <= text.length && equals(clip(text, prefix.length), prefix);
}

} // namespace text

namespace {

// h = ((h AND 0x0FFFFFFF) << 3) XOR (((h >> 2) XOR c) AND 0x7FFFFFFF). Bit 31 of h and c is always clear, so
// the second AND has no effect.
constexpr uint32_t addToHash(uint32_t hash, uint32_t ch) {
    return (hash << 3 & 0x7FFFFFF8) ^ (hash >> 2 ^ ch);
}

// Two steps in one: addToHash(addToHash(hash, a), b) with its shifts multiplied out, which halves the chain
// of dependent steps.
constexpr uint32_t addToHash(uint32_t hash, uint32_t a, uint32_t b) {
    return (hash << 6 & 0x7FFFFFC0) ^ (hash << 1 & 0x60000007) ^ (hash >> 4 ^ addToHash(a, b));
}

// A step is linear over bits, so the hash of two consecutive pieces is the hash of the first, advanced over
// as many zeros as the second has characters, XOR the hash of the second. Long text is hashed as four pieces
// in parallel, since the processor would stall on a single chain of dependent steps.
constexpr int32_t kHashPiece = 64;

class CHashOverPiece {
public:
    constexpr CHashOverPiece() {
        for (uint32_t byte = 0; byte < 4; ++byte) {
            for (uint32_t value = 0; value < 256; ++value) {
                uint32_t hash = value << (8 * byte);
                for (int32_t i = 0; i < kHashPiece; ++i) hash = addToHash(hash, 0);
                m_bytes[byte][value] = hash;
            }
        }
    }
    constexpr uint32_t operator()(uint32_t hash) const {
        return m_bytes[0][hash & 255] ^ m_bytes[1][hash >> 8 & 255] ^ m_bytes[2][hash >> 16 & 255] ^
               m_bytes[3][hash >> 24];
    }

private:
    uint32_t m_bytes[4][256] = {};
};

constexpr CHashOverPiece kCarryOver;

template <class U> uint32_t hashUnits(text::SUnits<U> units, int32_t count) {
    uint32_t hash = 0;
    int32_t i = 0;
    for (; count - i >= 4 * kHashPiece; i += 4 * kHashPiece) {
        text::SUnits<U> first = units + i;
        uint32_t pieces[4] = {};
        for (int32_t k = 0; k < kHashPiece; ++k)
            for (int32_t p = 0; p < 4; ++p) pieces[p] = addToHash(pieces[p], first[p * kHashPiece + k]);
        for (uint32_t piece : pieces) hash = kCarryOver(hash) ^ piece;
    }
    for (; i + 2 <= count; i += 2) hash = addToHash(hash, units[i], units[i + 1]);
    if (i < count) hash = addToHash(hash, units[i]);
    return hash;
}

} // namespace

uint32_t text::getHash(const SStringView& view) {
    if (int32_t width = getFixedWidth(view))
        return withUnits(view, width, [&](auto units) { return hashUnits(units, view.length); });
    uint32_t hash = 0;
    CStringWindow window(*view.encoding, view.data, view.byteSize, 0);
    for (char32_t ch; window.next(ch);) hash = addToHash(hash, ch);
    return hash;
}

uint32_t CString::getHash() const {
    uint32_t hash = m_hash.load(std::memory_order_relaxed);
    if (hash != 0) return hash;
    hash = text::getHash(view());
    m_hash.store(hash, std::memory_order_relaxed);
    return hash;
}

int CString::compare(const CStringArg& other, int32_t limit) const {
    if (limit < 0) return text::compare(view(), other.getView());
    return text::compare(text::clip(view(), limit), text::clip(other.getView(), limit));
}

int CString::compareIgnoreCase(const CStringArg& other, int32_t limit) const {
    return text::compareIgnoreCase(text::clip(view(), limit), text::clip(other.getView(), limit));
}

int CString::compareRange(SStringPos start, SStringPos end, const CStringArg& other, int32_t limit) const {
    return text::compare(text::clip(getRange(resolve(start), resolve(end)), limit),
                         text::clip(other.getView(), limit));
}

bool CString::equals(const CStringArg& other, int32_t limit) const {
    if (limit < 0) return text::equals(view(), other.getView());
    return text::equals(text::clip(view(), limit), text::clip(other.getView(), limit));
}

bool CString::equalsIgnoreCase(const CStringArg& other, int32_t limit) const {
    SStringView a = text::clip(view(), limit);
    SStringView b = text::clip(other.getView(), limit);
    return a.length == b.length && text::compareIgnoreCase(a, b) == 0;
}

bool CString::startsWith(const CStringArg& prefix) const {
    return text::startsWith(view(), prefix.getView());
}

bool CString::startsWithAt(SStringPos start, const CStringArg& prefix) const {
    return text::startsWith(getRange(resolve(start), getEnd()), prefix.getView());
}

bool CString::endsWith(const CStringArg& suffix) const {
    int32_t count = suffix.getLength();
    if (count > m_length) return false;
    SStringPos start = count == m_length ? kStringBegin : resolve(movePosition(kStringEnd, -count));
    return text::equals(getRange(start, getEnd()), suffix.getView());
}

} // namespace peru
