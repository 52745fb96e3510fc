// Editing: always a new string.
#include "peru/strings/String.h"
#include "peru/strings/StringText.h"
#include "peru/strings/StringWindow.h"

#include <vector>

namespace peru {

namespace {

uint8_t* append(uint8_t* out, const uint8_t* data, int64_t size) {
    if (size > 0) std::memcpy(out, data, static_cast<size_t>(size));
    return out + size;
}

} // namespace

// The core of insert, remove and the ranged replace: one block of the exact size.
P<IString> CString::edit(SStringPos start, SStringPos end, const SStringView& inserted) const {
    if (start.index > end.index || start.offset > end.offset) end = start;
    // Text in this string's own encoding is inserted byte for byte, so that bytes which only other programs
    // can decode are kept. They are dropped only if they would combine with their new neighbours into a
    // character.
    bool raw = inserted.encodingId == m_encodingId && !inserted.wellFormed;
    int32_t length = m_length - (end.index - start.index) + inserted.length;
    for (;; raw = false) {
        int64_t needed = raw ? inserted.byteSize : text::getEncodedSize(*m_encoding.get(), inserted);
        if (needed < 0) {
            P<IString> copy = text::convert(getUTF8CharEncoding(), view(), '?');
            // If this string's own characters would not survive in UTF-8, the inserted text gets substitutes
            // instead.
            if (copy->getLength() != m_length)
                return edit(start, end, text::convert(getEncoding(), inserted, '?')->getView());
            SStringPos from = start.index >= copy->getLength() ? kStringEnd : copy->getPosition(start.index);
            return copy->replaceRange(from, end.index - start.index, CStringArg(inserted));
        }
        int64_t tail = m_byteSize - end.offset;
        int64_t size = start.offset + needed + tail;
        P<CString> result = reserve(*m_encoding.get(), size);
        uint8_t* out = append(result->getRoom(), m_data, start.offset);
        if (raw)
            append(out, inserted.data, needed);
        else
            text::encode(*m_encoding.get(), inserted, out);
        append(out + needed, m_data + end.offset, tail);
        bool known = m_wellFormed && inserted.wellFormed && inserted.encodingId == m_encodingId;
        result->settle(known ? length : -1, known);
        if (raw ? result->getLength() == length : result->getLength() <= length) return result;
        if (raw) continue;
        // The malformed bytes around the removed range make a character together.
        const int32_t next = skipMalformed(end.offset);
        if (next == end.offset) return result;
        end.offset = next;
    }
}

int32_t CString::skipMalformed(int32_t offset) const {
    const int32_t next = m_encoding->findValidChar(m_data, m_byteSize, offset);
    return next < 0 ? m_byteSize : next;
}

P<IString> CString::concat(const CStringArg& text) const {
    return edit(getEnd(), getEnd(), text.getView());
}

P<IString> CString::insert(SStringPos pos, const CStringArg& text) const {
    pos = resolve(pos);
    return edit(pos, pos, text.getView());
}

P<IString> CString::remove(SStringPos pos, int32_t count) const {
    return replaceRange(pos, count, CStringArg(nullptr));
}

P<IString> CString::replaceRange(SStringPos pos, int32_t count, const CStringArg& text) const {
    pos = resolve(pos);
    return edit(pos, getEndOf(pos, count), text.getView());
}

P<IString> CString::replace(const CStringArg& search, const CStringArg& replacement, SStringPos start,
                            SStringPos end) const {
    const SStringView& wanted = search.getView();
    const SStringView& inserted = replacement.getView();
    std::vector<std::pair<int32_t, int32_t>> matches; // byte ranges
    start = resolve(start);
    end = resolve(end);
    int32_t length = m_length;
    for (SStringPos from = start; wanted.length > 0;) {
        SStringPos match = findView(wanted, from, end);
        if (!match.isFound()) break;
        length += inserted.length - wanted.length;
        from = getEndOf(match, wanted.length);
        matches.emplace_back(match.offset, from.offset);
        if (from.index >= end.index) break;
    }
    if (matches.empty()) return P<IString>::share(const_cast<CString*>(this));

    int64_t needed = text::getEncodedSize(*m_encoding.get(), inserted);
    if (needed < 0) {
        P<IString> copy = text::convert(getUTF8CharEncoding(), view(), '?');
        if (copy->getLength() == m_length)
            return copy->replace(search, replacement, copy->getPosition(start.index),
                                 copy->getPosition(end.index));
        // As in edit(): the inserted text gets substitutes.
        return replace(search, *text::convert(getEncoding(), inserted, '?'), start, end);
    }
    for (bool dropped = false;; dropped = true) {
        int64_t size = m_byteSize;
        for (auto [from, to] : matches) size += needed - (to - from);
        P<CString> result = reserve(*m_encoding.get(), size);
        uint8_t* out = result->getRoom();
        int32_t done = 0;
        for (auto [from, to] : matches) {
            out = append(out, m_data + done, from - done);
            text::encode(*m_encoding.get(), inserted, out);
            out += needed;
            done = to;
        }
        append(out, m_data + done, m_byteSize - done);
        result->settle();
        if (dropped || result->getLength() <= length) return result;
        // As in edit(): malformed bytes make a character together.
        for (auto& match : matches) match.second = skipMalformed(match.second);
    }
}

P<IString> CString::mapCase(char32_t (*map)(char32_t)) const {
    std::u32string mapped;
    mapped.reserve(static_cast<size_t>(m_length));
    bool changed = false;
    CStringWindow window(*m_encoding.get(), m_data, m_byteSize, 0);
    for (char32_t ch; window.next(ch);) {
        mapped.push_back(map(ch));
        changed |= mapped.back() != ch;
    }
    if (!changed) return P<IString>::share(const_cast<CString*>(this));
    CStringArg arg(*getUTF32CharEncoding(), mapped.data(), static_cast<int32_t>(mapped.size() * 4));
    bool fits = text::getEncodedSize(*m_encoding.get(), arg.getView()) >= 0;
    return text::convert(fits ? getEncoding() : getUTF8CharEncoding(), arg.getView(), '?');
}

P<IString> CString::toLower() const {
    return mapCase(text::toLower);
}

P<IString> CString::toUpper() const {
    return mapCase(text::toUpper);
}

namespace {

P<IString> join(const CStringArg& a, const CStringArg& b) {
    const SStringView& first = a.getView();
    const SStringView& second = b.getView();
    CString receiver(P<ICharEncoding>::share(const_cast<ICharEncoding*>(first.encoding)), first.data,
                     first.byteSize, EStringStorage::refer, false, first.length);
    return receiver.concat(CStringArg(second));
}

} // namespace

P<IString> operator+(const P<IString>& a, const P<IString>& b) {
    return a ? a->concat(b) : join(a, b);
}
P<IString> operator+(const P<IString>& a, const char* b) {
    return a ? a->concat(b) : join(a, b);
}
P<IString> operator+(const P<IString>& a, const wchar_t* b) {
    return a ? a->concat(b) : join(a, b);
}
P<IString> operator+(const P<IString>& a, const char16_t* b) {
    return a ? a->concat(b) : join(a, b);
}
P<IString> operator+(const char* a, const P<IString>& b) {
    return join(a, b);
}
P<IString> operator+(const wchar_t* a, const P<IString>& b) {
    return join(a, b);
}
P<IString> operator+(const char16_t* a, const P<IString>& b) {
    return join(a, b);
}

} // namespace peru
