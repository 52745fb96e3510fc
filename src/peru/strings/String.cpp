#include "peru/strings/String.h"

#include "peru/Errors.h"
#include "peru/Pinned.h"
#include "peru/strings/StringText.h"
#include "peru/strings/StringWindow.h"

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <new>
#include <string>

namespace peru {

namespace {

alignas(4) constexpr unsigned char kZeros[8] = {};

// Bytes of an incomplete unit at the end. They are dropped, since an edit would misalign all units after
// them.
int32_t getPartialUnit(uint32_t encodingId, int32_t byteSize) {
    int32_t unit = getUnitSize(encodingId);
    return unit > 1 ? byteSize % unit : 0;
}

// Room for a terminator in any encoding.
constexpr int64_t kTerminatorSize = 4;

size_t getTerminatedSize(int64_t byteSize) {
    if (byteSize + kTerminatorSize > INT_MAX) throw std::bad_alloc();
    return static_cast<size_t>(byteSize + kTerminatorSize);
}

// The library's encodings live until the process exits; a caller's own encoding must be counted.
PFrail<ICharEncoding> holdEncoding(const ICharEncoding* encoding, uint32_t id) {
    const ICharEncoding* shared = nullptr;
    switch (id) {
    case ICharEncoding::kUTF8:
        shared = getUTF8CharEncoding().get();
        break;
    case ICharEncoding::kUTF16:
        shared = getUTF16CharEncoding().get();
        break;
    case ICharEncoding::kUTF32:
        shared = getUTF32CharEncoding().get();
        break;
    case ICharEncoding::kLatin1:
        shared = getLatin1CharEncoding().get();
        break;
    }
    return {const_cast<ICharEncoding*>(encoding), encoding != shared};
}

} // namespace

CStringArg::CStringArg(const IString& string) : m_view(string.getView()) {}

CStringArg::CStringArg(const IString* string)
    : m_view(string ? string->getView() : TNullString<char, CLatin1String>::get()->getView()) {}

CStringArg::CStringArg(const char* latin1)
    : m_view{getLatin1CharEncoding().get(),
             ICharEncoding::kLatin1,
             latin1 ? static_cast<int32_t>(std::strlen(latin1)) : 0,
             reinterpret_cast<const uint8_t*>(latin1 ? latin1 : reinterpret_cast<const char*>(kZeros)),
             0,
             true} {
    m_view.length = m_view.byteSize;
}

CStringArg::CStringArg(const wchar_t* wide)
    : m_view{getUTF32CharEncoding().get(),
             ICharEncoding::kUTF32,
             wide ? static_cast<int32_t>(std::wcslen(wide) * sizeof(wchar_t)) : 0,
             wide ? reinterpret_cast<const uint8_t*>(wide) : kZeros,
             -1,
             false} {}

CStringArg::CStringArg(const char16_t* wide)
    : m_view{getUTF16CharEncoding().get(),
             ICharEncoding::kUTF16,
             wide ? static_cast<int32_t>(std::char_traits<char16_t>::length(wide) * 2) : 0,
             wide ? reinterpret_cast<const uint8_t*>(wide) : kZeros,
             -1,
             false} {}

CStringArg::CStringArg(const ICharEncoding& encoding, const void* data, int32_t byteSize)
    : m_view{&encoding, encoding.getId(), byteSize, data ? static_cast<const uint8_t*>(data) : kZeros, -1,
             false} {
    if (!data) m_view.byteSize = 0;
    if (m_view.byteSize < 0) m_view.byteSize = encoding.getTerminatedLength(m_view.data);
    m_view.byteSize -= getPartialUnit(m_view.encodingId, m_view.byteSize);
}

void CStringArg::count() const {
    text::count(m_view);
}

CString::CString(const P<ICharEncoding>& encoding, const void* data, int32_t byteSize, EStringStorage storage,
                 bool terminated, int32_t length)
    : m_data(static_cast<const uint8_t*>(data)), m_byteSize(byteSize), m_terminated(terminated),
      m_owner(false), m_encoding(holdEncoding(encoding.get(), encoding->getId())), m_length(length),
      m_wellFormed(false), m_encodingId(encoding->getId()) {
    if (!m_data) {
        m_data = kZeros;
        m_byteSize = 0;
        m_length = 0;
        m_terminated = true;
        storage = EStringStorage::refer;
    } else if (m_byteSize < 0) {
        m_byteSize = encoding->getTerminatedLength(m_data);
        m_terminated = true;
    }
    if (int32_t partial = getPartialUnit(m_encodingId, m_byteSize); partial != 0) {
        m_byteSize -= partial;
        m_terminated = false;
    }
    if (storage == EStringStorage::copy) {
        auto* block = static_cast<uint8_t*>(std::malloc(getTerminatedSize(m_byteSize)));
        if (!block) throw std::bad_alloc();
        if (m_byteSize > 0) std::memcpy(block, m_data, static_cast<size_t>(m_byteSize));
        std::memset(block + m_byteSize, 0, kTerminatorSize);
        m_data = block;
        m_terminated = true;
    }
    m_owner = storage != EStringStorage::refer;
    SStringView all = view();
    settle(m_length, m_length >= 0 && text::getFixedWidth(all) != 0);
}

CString::CString(const SStringView& view, bool terminated)
    : m_data(view.data), m_byteSize(view.byteSize), m_terminated(terminated), m_owner(false),
      m_encoding(holdEncoding(view.encoding, view.encodingId)), m_length(view.length),
      m_wellFormed(view.wellFormed), m_encodingId(view.encodingId) {}

CString::~CString() {
    if (m_owner) std::free(const_cast<uint8_t*>(m_data));
}

P<CString> CString::reserve(const ICharEncoding& encoding, int64_t byteSize) {
    SRoom room{getTerminatedSize(byteSize)};
    SStringView view{&encoding, encoding.getId(), static_cast<int32_t>(byteSize), nullptr, 0, false};
    P<CString> string(new (room) CString(view, true));
    auto* bytes = reinterpret_cast<uint8_t*>(string.get()) + sizeof(CString);
    std::memset(bytes + byteSize, 0, kTerminatorSize);
    string->m_data = bytes;
    return string;
}

void CString::settle(int32_t length, bool wellFormed) {
    m_length = length;
    m_wellFormed = wellFormed;
    if (length >= 0) return;
    SStringView all = view();
    text::count(all);
    m_length = all.length;
    m_wellFormed = all.wellFormed;
}

P<IString> CString::empty() {
    return TNullString<char, CLatin1String>::get();
}

P<IString> CString::fromView(const SStringView& view) {
    P<CString> string = reserve(*view.encoding, view.byteSize);
    if (view.byteSize > 0) std::memcpy(string->getRoom(), view.data, static_cast<size_t>(view.byteSize));
    string->settle(view.length, view.wellFormed);
    return string;
}

P<IString> CString::fromUTF16(const char16_t* text, int32_t length) {
    return make<CUTF16String>(text, length);
}

int CString::compareTo(const P<IBase>& other) const {
    P<IString> string = tryCast<IString>(other);
    if (!string)
        throw CInvalidArgError("other", "CString::compareTo", P<IBase>::share(const_cast<CString*>(this)));
    return compare(string);
}

P<IString> CString::getObjectDesc() const {
    return "\"" + P<IString>::share(const_cast<CString*>(this)) + "\"";
}

bool CString::isEncoding(uint32_t id) const {
    return m_encodingId == id;
}

P<const IString> CString::getSliceRoot() const {
    return P<const IString>::share(this);
}

// --- Positions ---

int32_t CString::getOffset(int32_t index) const {
    return text::getOffset(view(), index);
}

SStringPos CString::getEndOf(SStringPos start, int32_t count) const {
    if (count < 0) return getEnd();
    count = std::min(count, m_length - start.index);
    if (count == 0) return start;
    if (int32_t width = text::getFixedWidth(view()))
        return {start.index + count, start.offset + count * width};
    SStringPos end = movePosition(start, count - 1);
    getCharAndAdvance(end);
    return end;
}

SStringPos CString::getPosition(int32_t index) const {
    if (index < 0 || index >= m_length) return kStringEnd;
    return {index, text::getOffset(view(), index)};
}

SStringPos CString::movePosition(SStringPos pos, int32_t count) const {
    pos = resolve(pos);
    int64_t index = static_cast<int64_t>(pos.index) + count;
    if (index < 0 || index >= m_length) return kStringEnd;
    int32_t target = static_cast<int32_t>(index);
    if (text::getFixedWidth(view()) != 0 || target < -static_cast<int64_t>(count)) return getPosition(target);
    if (count >= 0) {
        SStringView rest = getRange(pos, getEnd());
        return {target, pos.offset + text::getOffset(rest, count)};
    }
    // The code page cannot be read backwards, so the scan restarts at the beginning.
    if (m_encodingId == ICharEncoding::kCodePage) return getPosition(target);
    for (; count < 0; ++count) pos.offset = m_encoding->findPrevChar(m_data, m_byteSize, pos.offset);
    return {target, pos.offset};
}

char32_t CString::getCharAndAdvance(SStringPos& pos) const {
    SStringPos at = resolve(pos);
    char32_t ch = 0;
    int32_t next = at.index >= m_length ? -1 : m_encoding->decodeNextChar(ch, m_data, m_byteSize, at.offset);
    pos = next < 0 ? kStringEnd : SStringPos{at.index + 1, next};
    return next < 0 ? 0 : ch;
}

char32_t CString::getCharAt(int32_t index) const {
    return getCharAt(getPosition(index));
}

char32_t CString::getCharAt(SStringPos pos) const {
    return getCharAndAdvance(pos);
}

// --- Parts ---

P<IString> CString::getSlice(SStringPos start, SStringPos end) const {
    SStringView view = getRange(start, end);
    if (view.byteSize == m_byteSize) return P<IString>::share(const_cast<CString*>(this));
    bool terminated = m_terminated && view.data + view.byteSize == m_data + m_byteSize;
    return make<CStringSlice>(getSliceRoot(), view, terminated);
}

P<IString> CString::substring(SStringPos start, SStringPos end) const {
    return getSlice(resolve(start), resolve(end));
}

P<IString> CString::nextToken(SStringPos& pos, const CStringArg& separatorSet) const {
    if (!pos.isFound()) return nullptr;
    SStringPos start = resolve(pos);
    SStringPos separator = findAnyOf(separatorSet, start);
    pos = separator;
    if (separator.isFound()) getCharAndAdvance(pos);
    return getSlice(start, resolve(separator));
}

P<IString> CString::nextTokenByString(SStringPos& pos, const CStringArg& separator) const {
    if (!pos.isFound()) return nullptr;
    SStringPos start = resolve(pos);
    SStringPos match = separator.isEmpty() ? kStringEnd : find(separator, start);
    pos = match;
    for (int32_t i = match.isFound() ? separator.getLength() : 0; i > 0; --i) getCharAndAdvance(pos);
    return getSlice(start, resolve(match));
}

// Malformed bytes are not trimmed: other programs may be able to read them.
template <class F> P<IString> CString::trimBy(F&& isTrimmed) const {
    char32_t ch;
    auto getCharSizeAt = [&](SStringPos pos) {
        return m_encoding->getCharSizeAt(m_data, m_byteSize, pos.offset);
    };
    SStringPos start = kStringBegin;
    SStringPos next = start;
    while (getCharSizeAt(start) > 0 && isTrimmed(getCharAndAdvance(next))) start = next;
    SStringPos end = getEnd();
    if (m_encodingId == ICharEncoding::kCodePage) {
        // The code page cannot be read backwards: this goes forward past the last character to be kept.
        end = start;
        for (next = start; next.offset < m_byteSize;) {
            const bool malformed = getCharSizeAt(next) <= 0;
            ch = getCharAndAdvance(next);
            if (!next.isFound()) return getSlice(start, getEnd());
            if (malformed || !isTrimmed(ch)) end = next;
        }
        return getSlice(start, end);
    }
    CStringWindow back(*m_encoding.get(), m_data, m_byteSize, m_byteSize, CStringWindow::backward);
    while (end.index > start.index && back.next(ch) && isTrimmed(ch)) {
        const SStringPos last{end.index - 1, back.getOffset()};
        if (last.offset + getCharSizeAt(last) != end.offset) break;
        end = last;
    }
    return getSlice(start, end);
}

P<IString> CString::trim() const {
    return trimBy(text::isWhiteSpace);
}

P<IString> CString::trim(const CStringArg& characters) const {
    const SStringView& set = characters.getView();
    return trimBy([&](char32_t ch) {
        CStringWindow window(*set.encoding, set.data, set.byteSize, 0);
        for (char32_t member; window.next(member);)
            if (member == ch) return true;
        return false;
    });
}

CStringSlice::CStringSlice(const P<const IString>& parent, const SStringView& view, bool terminated)
    : CString(view, terminated), m_parent(parent) {}

CStringSlice::~CStringSlice() = default;

// --- The concrete classes ---

namespace {

int32_t getByteSize(int32_t length, int32_t unit) {
    if (length > INT32_MAX / unit) throw std::bad_alloc();
    return length < 0 ? -1 : length * unit;
}

} // namespace

CLatin1String::CLatin1String(const char* text, int32_t length, EStringStorage storage)
    : CString(getLatin1CharEncoding(), text, length, storage) {}
CUTF8String::CUTF8String(const char* text, int32_t length, EStringStorage storage)
    : CString(getUTF8CharEncoding(), text, length, storage) {}
CUTF16String::CUTF16String(const char16_t* text, int32_t length, EStringStorage storage)
    : CString(getUTF16CharEncoding(), text, getByteSize(length, 2), storage) {}
CUTF32String::CUTF32String(const char32_t* text, int32_t length, EStringStorage storage)
    : CString(getUTF32CharEncoding(), text, getByteSize(length, 4), storage) {}
CWCharString::CWCharString(const wchar_t* text, int32_t length, EStringStorage storage)
    : CString(getUTF32CharEncoding(), text, getByteSize(length, sizeof(wchar_t)), storage) {}
CCPString::CCPString(const char* text, int32_t length, EStringStorage storage)
    : CString(getCPCharEncoding(), text, length, storage) {}

template <class C, class S> const P<IString>& TNullString<C, S>::get() {
    static const CGlobalObjFactory::SKey key;
    static constinit TPinned<IString> pinned;
    return pinned.get(key, [] {
        auto* text = reinterpret_cast<const typename S::Unit*>(kZeros);
        return P<IString>(make<S>(text, -1, EStringStorage::refer));
    });
}

template class TNullString<char, CLatin1String>;
template class TNullString<unsigned char, CCPString>;
template class TNullString<unsigned char, CUTF16String>;
template class TNullString<unsigned char, CUTF8String>;
template class TNullString<unsigned int, CUTF32String>;
template class TNullString<wchar_t, CWCharString>;

P<IString> newString(const char* latin1) {
    if (!latin1) return TNullString<char, CLatin1String>::get();
    return make<CLatin1String>(latin1);
}
P<IString> newString(const wchar_t* wide) {
    if (!wide) return TNullString<wchar_t, CWCharString>::get();
    return make<CWCharString>(wide);
}
P<IString> newString(const char16_t* wide) {
    if (!wide) return TNullString<unsigned char, CUTF16String>::get();
    return make<CUTF16String>(wide);
}

P<IString> literals::operator""_s(const char* text, size_t length) {
    return make<CString>(getLatin1CharEncoding(), text, static_cast<int32_t>(length), EStringStorage::refer,
                         true);
}

} // namespace peru
