// Comparing and hashing.
#include "peru/String.h"
#include "peru/StringText.h"
#include "peru/StringWindow.h"

namespace peru {

namespace text {

namespace {

template <class T> int order(T a, T b) {
    return a < b ? -1 : a > b ? 1 : 0;
}

// Blocks of 16 are tested without a branch, which the compiler turns into vector compares.
template <class A, class B> int32_t findDifference(SUnits<A> a, SUnits<B> b, int32_t count) {
    int32_t i = 0;
    for (; i + 16 <= count; i += 16) {
        uint32_t different = 0;
        for (int32_t k = 0; k < 16; ++k)
            different |= static_cast<uint32_t>(a[i + k]) ^ static_cast<uint32_t>(b[i + k]);
        if (different) break;
    }
    while (i < count && a[i] == b[i]) ++i;
    return i;
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
    return compareBySteps(a, b, [](char32_t ch) { return ch; });
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

// h = ((h AND 0x0FFFFFFF) << 3) XOR (((h >> 2) XOR c) AND 0x7FFFFFFF): bit 31 is always clear.
inline uint32_t addToHash(uint32_t hash, uint32_t ch) {
    return ((hash & 0x0FFFFFFF) << 3) ^ (((hash >> 2) ^ ch) & 0x7FFFFFFF);
}

} // namespace

uint32_t CString::getHash() const {
    uint32_t hash = m_hash.load(std::memory_order_relaxed);
    if (hash != 0) return hash;
    SStringView view = getView();
    if (int32_t width = text::getFixedWidth(view)) {
        hash = text::withUnits(view, width, [&](auto units) {
            uint32_t h = 0;
            for (int32_t i = 0; i < view.length; ++i) h = addToHash(h, units[i]);
            return h;
        });
    } else {
        CStringWindow window(*m_encoding, m_data, m_byteSize, 0);
        for (char32_t ch; window.next(ch);) hash = addToHash(hash, ch);
    }
    m_hash.store(hash, std::memory_order_relaxed);
    return hash;
}

int CString::compare(const CStringArg& other, int32_t limit) const {
    if (limit < 0) return text::compare(getView(), other.getView());
    return text::compare(text::clip(getView(), limit), text::clip(other.getView(), limit));
}

int CString::compareIgnoreCase(const CStringArg& other, int32_t limit) const {
    return text::compareIgnoreCase(text::clip(getView(), limit), text::clip(other.getView(), limit));
}

int CString::compareRange(SStringPos start, SStringPos end, const CStringArg& other, int32_t limit) const {
    return text::compare(text::clip(getRange(resolve(start), resolve(end)), limit),
                         text::clip(other.getView(), limit));
}

bool CString::equals(const CStringArg& other, int32_t limit) const {
    if (limit < 0) return text::equals(getView(), other.getView());
    return text::equals(text::clip(getView(), limit), text::clip(other.getView(), limit));
}

bool CString::equalsIgnoreCase(const CStringArg& other, int32_t limit) const {
    SStringView a = text::clip(getView(), limit);
    SStringView b = text::clip(other.getView(), limit);
    return a.length == b.length && text::compareIgnoreCase(a, b) == 0;
}

bool CString::startsWith(const CStringArg& prefix) const {
    return text::startsWith(getView(), prefix.getView());
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
