// Searching.
#include "peru/strings/String.h"
#include "peru/strings/StringText.h"
#include "peru/strings/StringWindow.h"

#include <cwchar>

namespace peru {

namespace text {

namespace {

template <class U>
int32_t findUnits(SUnits<U> text, int32_t count, const uint8_t* wanted, int32_t wantedCount) {
    U first = SUnits<U>{wanted}[0];
    size_t wantedSize = static_cast<size_t>(wantedCount) * sizeof(U);
    for (int32_t start = 0; start <= count - wantedCount; ++start) {
        int32_t at = findUnit(text + start, count - wantedCount + 1 - start, first);
        if (at < 0) return -1;
        start += at;
        if (wantedCount == 1 || std::memcmp((text + start).data, wanted, wantedSize) == 0) return start;
    }
    return -1;
}

// Byte offset of the first match of a non-empty piece; both are well-formed text of one encoding, so that a
// match of units is a match of characters.
int32_t findPiece(const SStringView& text, const uint8_t* piece, int32_t pieceSize) {
    if (pieceSize > text.byteSize) return -1;
    switch (getUnitSize(text.encodingId)) {
    case 2: {
        int32_t at = findUnits<uint16_t>({text.data}, text.byteSize / 2, piece, pieceSize / 2);
        return at < 0 ? -1 : at * 2;
    }
    case 4: {
        int32_t at = findUnits<uint32_t>({text.data}, text.byteSize / 4, piece, pieceSize / 4);
        return at < 0 ? -1 : at * 4;
    }
    }
    const void* match = pieceSize == 1 ? std::memchr(text.data, *piece, static_cast<size_t>(text.byteSize))
                                       : memmem(text.data, static_cast<size_t>(text.byteSize), piece,
                                                static_cast<size_t>(pieceSize));
    return match ? static_cast<int32_t>(static_cast<const uint8_t*>(match) - text.data) : -1;
}

int32_t findLastPiece(const SStringView& text, const uint8_t* piece, int32_t pieceSize) {
    int32_t unit = getUnitSize(text.encodingId);
    for (int32_t at = text.byteSize - pieceSize; at >= 0; at -= unit) {
        if (unit == 1) {
            const void* match = memrchr(text.data, *piece, static_cast<size_t>(at) + 1);
            if (!match) return -1;
            at = static_cast<int32_t>(static_cast<const uint8_t*>(match) - text.data);
        }
        if (std::memcmp(text.data + at, piece, static_cast<size_t>(pieceSize)) == 0) return at;
    }
    return -1;
}

// The search text in the encoding of the searched text: used directly, or re-encoded on the stack.
class CPiece {
public:
    enum EState { ready, impossible, tooLong };

    CPiece(const SStringView& text, const SStringView& wanted) {
        if (text.encodingId == wanted.encodingId && wanted.wellFormed) {
            m_data = wanted.data;
            m_size = wanted.byteSize;
            return;
        }
        // With one byte per character on both sides the bytes are the same in both encodings. If the searched
        // text is UTF-8 with longer characters, that only holds for ASCII.
        if (getFixedWidth(wanted) == 1 && getUnitSize(text.encodingId) == 1 &&
            (getFixedWidth(text) == 1 || isASCII(wanted))) {
            m_data = wanted.data;
            m_size = wanted.byteSize;
            return;
        }
        if (getFixedWidth(wanted) == 1 && text.encodingId == ICharEncoding::kUTF16 &&
            wanted.length * 2 <= static_cast<int32_t>(sizeof(m_buffer))) {
            for (; m_size < wanted.length * 2; m_size += 2) {
                uint16_t unit = wanted.data[m_size / 2];
                std::memcpy(m_buffer + m_size, &unit, sizeof(unit));
            }
            return;
        }
        encodeBySteps(text, wanted);
    }

    EState getState() const { return m_state; }
    const uint8_t* getData() const { return m_data; }
    int32_t getSize() const { return m_size; }

private:
    static bool isASCII(const SStringView& view) {
        // Search texts are usually too short for vectors to pay off.
        for (int32_t i = 0; i < view.byteSize; ++i)
            if (view.data[i] >= 0x80) return false;
        return true;
    }

    void encodeBySteps(const SStringView& text, const SStringView& wanted) {
        CStringWindow window(*wanted.encoding, wanted.data, wanted.byteSize, 0);
        for (char32_t ch, back; window.next(ch);) {
            int32_t end = text.encoding->encodeChar(ch, m_buffer, sizeof(m_buffer), m_size);
            if (end == m_size) {
                m_state = text.encoding->getEncodedSize(ch) == 0 ? impossible : tooLong;
                return;
            }
            // A character that the encoder writes but the decoder rejects cannot occur in well-formed text.
            if (text.encoding->decodeChar(back, m_buffer, end, m_size) != end) {
                m_state = impossible;
                return;
            }
            m_size = end;
        }
    }

    EState m_state = ready;
    const uint8_t* m_data = m_buffer;
    int32_t m_size = 0;
    uint8_t m_buffer[512];
};

bool matchesAt(const SStringView& text, int32_t offset, const SStringView& wanted) {
    CStringWindow a(*text.encoding, text.data, text.byteSize, offset);
    CStringWindow b(*wanted.encoding, wanted.data, wanted.byteSize, 0);
    for (char32_t ca, cb; b.next(cb);)
        if (!a.next(ca) || ca != cb) return false;
    return true;
}

// The result is relative to `text`.
SStringPos findBySteps(const SStringView& text, const SStringView& wanted) {
    char32_t first = 0;
    char32_t ch;
    CStringWindow(*wanted.encoding, wanted.data, wanted.byteSize, 0).next(first);
    CStringWindow window(*text.encoding, text.data, text.byteSize, 0);
    for (int32_t index = 0; index + wanted.length <= text.length && window.next(ch); ++index)
        if (ch == first && matchesAt(text, window.getOffset(), wanted)) return {index, window.getOffset()};
    return kStringEnd;
}

SStringPos findLastBySteps(const SStringView& text, const SStringView& wanted) {
    char32_t first = 0;
    char32_t ch;
    CStringWindow(*wanted.encoding, wanted.data, wanted.byteSize, 0).next(first);
    CStringWindow window(*text.encoding, text.data, text.byteSize, text.byteSize, CStringWindow::backward);
    for (int32_t index = text.length - 1; window.next(ch); --index)
        if (ch == first && index + wanted.length <= text.length &&
            matchesAt(text, window.getOffset(), wanted))
            return {index, window.getOffset()};
    return kStringEnd;
}

SStringPos toPlace(const SStringView& text, int32_t offset) {
    if (offset < 0) return kStringEnd;
    int32_t width = getFixedWidth(text);
    // A shift: a division would cost as much as the search in a short text.
    return {width ? offset >> (width >> 1) : countWellFormed(text, offset), offset};
}

template <bool last> SStringPos findIn(const SStringView& text, const SStringView& wanted) {
    if (wanted.length > text.length) return kStringEnd;
    if (text.wellFormed) {
        CPiece piece(text, wanted);
        if (piece.getState() == CPiece::impossible) return kStringEnd;
        if (piece.getState() == CPiece::ready)
            return toPlace(text, last ? findLastPiece(text, piece.getData(), piece.getSize())
                                      : findPiece(text, piece.getData(), piece.getSize()));
    }
    return last ? findLastBySteps(text, wanted) : findBySteps(text, wanted);
}

// A set of characters: a flag for each of the first 256, a search through the text for the others.
class CCharacterSet {
public:
    explicit CCharacterSet(const SStringView& view) : m_view(view) {
        CStringWindow window(*view.encoding, view.data, view.byteSize, 0);
        for (char32_t ch; window.next(ch);) {
            if (ch < 256)
                m_low[ch] = true;
            else
                m_hasHigh = true;
        }
    }
    bool contains(char32_t ch) const {
        if (ch < 256) return m_low[ch];
        if (!m_hasHigh) return false;
        CStringWindow window(*m_view.encoding, m_view.data, m_view.byteSize, 0);
        for (char32_t member; window.next(member);)
            if (member == ch) return true;
        return false;
    }

private:
    const SStringView& m_view;
    bool m_low[256] = {};
    bool m_hasHigh = false;
};

SStringPos findMember(const SStringView& text, const SStringView& members) {
    CCharacterSet set(members);
    if (int32_t width = getFixedWidth(text)) {
        return withUnits(text, width, [&](auto units) {
            for (int32_t i = 0; i < text.length; ++i)
                if (set.contains(units[i])) return SStringPos{i, i * width};
            return kStringEnd;
        });
    }
    CStringWindow window(*text.encoding, text.data, text.byteSize, 0);
    char32_t ch;
    for (int32_t index = 0; window.next(ch); ++index)
        if (set.contains(ch)) return {index, window.getOffset()};
    return kStringEnd;
}

SStringPos findLastMember(const SStringView& text, const SStringView& members) {
    CCharacterSet set(members);
    CStringWindow window(*text.encoding, text.data, text.byteSize, text.byteSize, CStringWindow::backward);
    char32_t ch;
    for (int32_t index = text.length - 1; window.next(ch); --index)
        if (set.contains(ch)) return {index, window.getOffset()};
    return kStringEnd;
}

SStringPos shift(SStringPos found, SStringPos start) {
    return found.isFound() ? SStringPos{found.index + start.index, found.offset + start.offset} : kStringEnd;
}

// Lets the encoding throw its own error for text that cannot be read backwards.
void requireBackward(const SStringView& text) {
    if (text.encodingId == ICharEncoding::kCodePage)
        text.encoding->findPrevChar(text.data, text.byteSize, text.byteSize);
}

SStringView viewOf(const char32_t& ch) {
    return {getUTF32CharEncoding().get(),
            ICharEncoding::kUTF32,
            4,
            reinterpret_cast<const uint8_t*>(&ch),
            1,
            true};
}

} // namespace

} // namespace text

SStringPos CString::findView(const SStringView& wanted, SStringPos start, SStringPos end) const {
    start = resolve(start);
    end = resolve(end);
    if (start.index > end.index) return kStringEnd;
    if (wanted.length == 0) return start;
    return text::shift(text::findIn<false>(getRange(start, end), wanted), start);
}

SStringPos CString::findLastView(const SStringView& wanted, SStringPos start, SStringPos end) const {
    start = resolve(start);
    end = resolve(end);
    SStringView range = getRange(start, end);
    text::requireBackward(range);
    if (start.index > end.index) return kStringEnd;
    if (wanted.length == 0) return end;
    return text::shift(text::findIn<true>(range, wanted), start);
}

SStringPos CString::find(const CStringArg& wanted, SStringPos start, SStringPos end) const {
    return findView(wanted.getView(), start, end);
}

SStringPos CString::findLast(const CStringArg& wanted, SStringPos start, SStringPos end) const {
    return findLastView(wanted.getView(), start, end);
}

SStringPos CString::findChar(char32_t ch, SStringPos start, SStringPos end) const {
    if (ch > kMaxCodePoint) return kStringEnd;
    return findView(text::viewOf(ch), start, end);
}

SStringPos CString::findLastChar(char32_t ch, SStringPos start, SStringPos end) const {
    if (ch > kMaxCodePoint) return kStringEnd;
    return findLastView(text::viewOf(ch), start, end);
}

SStringPos CString::findAnyOf(const CStringArg& set, SStringPos start, SStringPos end) const {
    start = resolve(start);
    return text::shift(text::findMember(getRange(start, resolve(end)), set.getView()), start);
}

SStringPos CString::findLastAnyOf(const CStringArg& set, SStringPos start, SStringPos end) const {
    start = resolve(start);
    SStringView range = getRange(start, resolve(end));
    text::requireBackward(range);
    return text::shift(text::findLastMember(range, set.getView()), start);
}

} // namespace peru
