// Immutable text in any encoding, seen as a sequence of Unicode code points.
#pragma once

#include "peru/strings/ICharEncoding.h"

#include <concepts>
#include <string>
#include <string_view>

namespace peru {

class IString;

// A position in a string: character index and byte offset, so that a scan over multi-byte text continues in
// constant time. Index -1 means the end, or "not found".
struct SStringPos {
    int32_t index = -1;
    int32_t offset = -1;

    bool isFound() const { return index >= 0; }
    bool operator==(const SStringPos&) const = default;
};

inline constexpr SStringPos kStringBegin{0, 0};
inline constexpr SStringPos kStringEnd{-1, -1};

// Encoded text and what is known about it.
struct SStringView {
    const ICharEncoding* encoding;
    uint32_t encodingId;
    int32_t byteSize;
    const uint8_t* data;
    int32_t length;  // in characters, -1 if not counted yet
    bool wellFormed; // known to have no malformed bytes; only set once the length is known
};

// A text argument in any of its forms, without allocation: a string object, a zero-terminated Latin-1
// pointer, a zero-terminated wide pointer (wchar_t or char16_t), or encoded bytes. It refers to the text and
// must not outlive the call. A null pointer is an empty text.
class PERU_API CStringArg {
public:
    CStringArg(const IString& string);
    CStringArg(const P<IString>& string) : CStringArg(static_cast<const IString*>(string.get())) {}
    template <std::derived_from<IString> S> CStringArg(const P<S>& string)
        : CStringArg(static_cast<const IString*>(string.get())) {}
    CStringArg(const char* latin1);
    CStringArg(const wchar_t* wide);
    CStringArg(const char16_t* wide);
    CStringArg(std::nullptr_t) : CStringArg(static_cast<const char*>(nullptr)) {}
    CStringArg(const ICharEncoding& encoding, const void* data, int32_t byteSize);
    explicit CStringArg(const SStringView& view) : m_view(view) {}

    const ICharEncoding& getEncoding() const { return *m_view.encoding; }
    uint32_t getEncodingId() const { return m_view.encodingId; }
    const uint8_t* getData() const { return m_view.data; }
    int32_t getByteSize() const { return m_view.byteSize; }
    // In characters; counted on first use if not known.
    int32_t getLength() const { return getView().length; }
    bool isEmpty() const { return m_view.byteSize == 0 || getLength() == 0; }
    // The view with its length counted.
    const SStringView& getView() const {
        if (m_view.length < 0) count();
        return m_view;
    }

private:
    CStringArg(const IString* string); // null is an empty text
    void count() const;

    mutable SStringView m_view;
};

// Ordering, implemented by strings.
class PERU_API IComparable : public virtual IBase {
public:
    // Negative, zero or positive. Throws CInvalidArgError if the other object is not comparable with this
    // one.
    virtual int compareTo(const P<IBase>& other) const = 0;
};

// Every operation that takes text accepts all forms of CStringArg. Ranges are given as start and end
// position; the default end is the end of the string. Malformed bytes are skipped by every scan and do not
// count towards the length. A string may be read by any number of threads.
class PERU_API IString : public virtual IComparable {
public:
    // --- Positions ---
    virtual SStringPos getPosition(int32_t index) const = 0; // kStringEnd if there is no such character
    // Moves by `count` characters, backwards if negative; kStringEnd if there is no such character.
    virtual SStringPos movePosition(SStringPos pos, int32_t count) const = 0;
    // Returns the character at `pos` and advances `pos`. At the end returns 0 and sets `pos` to kStringEnd.
    virtual char32_t getCharAndAdvance(SStringPos& pos) const = 0;
    virtual char32_t getCharAt(int32_t index) const = 0; // 0 if out of range
    virtual char32_t getCharAt(SStringPos pos) const = 0;

    // --- Comparing --- Depends on the code points only: equal strings in different encodings have the same
    // hash.
    virtual uint32_t getHash() const = 0;
    // Compares by code point, at most `limit` characters unless -1.
    virtual int compare(const CStringArg& other, int32_t limit = -1) const = 0;
    virtual int compareIgnoreCase(const CStringArg& other, int32_t limit = -1) const = 0;
    virtual int compareRange(SStringPos start, SStringPos end, const CStringArg& other,
                             int32_t limit = -1) const = 0;
    virtual bool equals(const CStringArg& other, int32_t limit = -1) const = 0;
    virtual bool equalsIgnoreCase(const CStringArg& other, int32_t limit = -1) const = 0;
    bool isLess(const CStringArg& other) const { return compare(other) < 0; }
    bool isLessOrEqual(const CStringArg& other) const { return compare(other) <= 0; }
    bool isGreater(const CStringArg& other) const { return compare(other) > 0; }
    bool isGreaterOrEqual(const CStringArg& other) const { return compare(other) >= 0; }
    virtual bool startsWith(const CStringArg& prefix) const = 0;
    virtual bool startsWithAt(SStringPos start, const CStringArg& prefix) const = 0;
    virtual bool endsWith(const CStringArg& suffix) const = 0;

    // --- Finding --- The first (find) or last (findLast) match that lies entirely between start and end.
    // find returns the start for an empty text, findLast the end. The findLast family throws
    // CMethodNotImplementedError for text in the code page, which cannot be read backwards.
    virtual SStringPos find(const CStringArg& text, SStringPos start = kStringBegin,
                            SStringPos end = kStringEnd) const = 0;
    virtual SStringPos findLast(const CStringArg& text, SStringPos start = kStringBegin,
                                SStringPos end = kStringEnd) const = 0;
    virtual SStringPos findChar(char32_t ch, SStringPos start = kStringBegin,
                                SStringPos end = kStringEnd) const = 0;
    virtual SStringPos findLastChar(char32_t ch, SStringPos start = kStringBegin,
                                    SStringPos end = kStringEnd) const = 0;
    virtual SStringPos findAnyOf(const CStringArg& set, SStringPos start = kStringBegin,
                                 SStringPos end = kStringEnd) const = 0;
    virtual SStringPos findLastAnyOf(const CStringArg& set, SStringPos start = kStringBegin,
                                     SStringPos end = kStringEnd) const = 0;

    // --- Parts; these share the bytes of this string ---
    virtual P<IString> substring(SStringPos start, SStringPos end = kStringEnd) const = 0;
    // Returns the slice from `pos` to the next character of the set and moves `pos` past that separator, or
    // to kStringEnd after the last token. Returns an empty handle if `pos` is kStringEnd on entry.
    virtual P<IString> nextToken(SStringPos& pos, const CStringArg& separatorSet) const = 0;
    // The same with one separator of several characters.
    virtual P<IString> nextTokenByString(SStringPos& pos, const CStringArg& separator) const = 0;
    virtual P<IString> trim() const = 0; // white space at both ends
    virtual P<IString> trim(const CStringArg& characters) const = 0;

    // --- Editing; returns a new string, in this string's encoding if that can hold the result, otherwise in
    // UTF-8. replace, toLower and toUpper return this string if there is nothing to change. ---
    virtual P<IString> concat(const CStringArg& text) const = 0;
    virtual P<IString> insert(SStringPos pos, const CStringArg& text) const = 0;
    virtual P<IString> remove(SStringPos pos, int32_t count = -1) const = 0;
    virtual P<IString> replaceRange(SStringPos pos, int32_t count, const CStringArg& text) const = 0;
    virtual P<IString> replace(const CStringArg& search, const CStringArg& replacement,
                               SStringPos start = kStringBegin, SStringPos end = kStringEnd) const = 0;
    virtual P<IString> toLower() const = 0;
    virtual P<IString> toUpper() const = 0;

    // --- Conversion; returns this object if it is already terminated text in that encoding ---
    virtual P<IString> toCPString() const = 0;
    virtual P<IString> toUTF8String() const = 0;
    virtual P<IString> toUTF16String() const = 0;
    virtual P<IString> toUTF32String() const = 0;
    virtual P<IString> toWCharString() const = 0;
    virtual P<IString> toLatin1String() const = 0; // other characters become '?'
    virtual P<IString> getTerminated() const = 0;

    // --- Access ---
    virtual bool isEmpty() const = 0;
    virtual int32_t getLength() const = 0; // characters
    virtual bool isEncoding(uint32_t id) const = 0;
    virtual P<ICharEncoding> getEncoding() const = 0;
    virtual const uint8_t* getData() const = 0; // encoded bytes, valid while the string lives
    virtual int32_t getDataSize() const = 0;    // bytes, without the terminator
    virtual bool isTerminated() const = 0;
    virtual SStringView getView() const = 0; // all of the above in one call
};

// Concatenation in every mix of string objects and literals.
PERU_API P<IString> operator+(const P<IString>& a, const P<IString>& b);
PERU_API P<IString> operator+(const P<IString>& a, const char* b);
PERU_API P<IString> operator+(const P<IString>& a, const wchar_t* b);
PERU_API P<IString> operator+(const P<IString>& a, const char16_t* b);
PERU_API P<IString> operator+(const char* a, const P<IString>& b);
PERU_API P<IString> operator+(const wchar_t* a, const P<IString>& b);
PERU_API P<IString> operator+(const char16_t* a, const P<IString>& b);

} // namespace peru
