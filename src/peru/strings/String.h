// The string classes.
#pragma once

#include "peru/Object.h"
#include "peru/strings/IString.h"

#include <atomic>
#include <new>

namespace peru {

// How a string obtains its bytes.
enum class EStringStorage {
    copy = 0,  // allocates, copies and terminates
    adopt = 1, // takes ownership of a block from std::malloc
    refer = 2, // refers to bytes that the caller keeps valid, such as literals
};

// The implementation of IString; one class for all encodings.
class PERU_API CString : public CObject, public IString {
public:
    // byteSize -1: the text is zero-terminated. length -1: the characters are counted.
    CString(const P<ICharEncoding>& encoding, const void* data, int32_t byteSize = -1,
            EStringStorage storage = EStringStorage::copy, bool terminated = false, int32_t length = -1);
    ~CString() override;
    CString(const CString&) = delete;
    CString& operator=(const CString&) = delete;

    // The shared empty string.
    static P<IString> empty();
    static P<IString> fromView(const SStringView& view); // a copy
    // Text from outside. The string is in UTF-8, or in UTF-16 if the bytes are valid UTF-8 with characters
    // that UTF-8 strings reject, so that such texts are not empty and differ from each other. toStdString()
    // restores the bytes, invalid ones included.
    static P<IString> fromUTF8(std::string_view bytes);
    static P<IString> fromUTF16(const char16_t* text, int32_t length = -1);
    // The text as UTF-8 bytes. The bytes of a UTF-8 string are returned unchanged, malformed or not.
    static std::string toStdString(const CStringArg& text);
    static std::u16string toStdU16String(const CStringArg& text);

    int compareTo(const P<IBase>& other) const override;
    P<IString> getObjectDesc() const override;

    SStringPos getPosition(int32_t index) const override;
    SStringPos movePosition(SStringPos pos, int32_t count) const override;
    char32_t getCharAndAdvance(SStringPos& pos) const override;
    char32_t getCharAt(int32_t index) const override;
    char32_t getCharAt(SStringPos pos) const override;

    uint32_t getHash() const override;
    int compare(const CStringArg& other, int32_t limit = -1) const override;
    int compareIgnoreCase(const CStringArg& other, int32_t limit = -1) const override;
    int compareRange(SStringPos start, SStringPos end, const CStringArg& other,
                     int32_t limit = -1) const override;
    bool equals(const CStringArg& other, int32_t limit = -1) const override;
    bool equalsIgnoreCase(const CStringArg& other, int32_t limit = -1) const override;
    bool startsWith(const CStringArg& prefix) const override;
    bool startsWithAt(SStringPos start, const CStringArg& prefix) const override;
    bool endsWith(const CStringArg& suffix) const override;

    SStringPos find(const CStringArg& text, SStringPos start = kStringBegin,
                    SStringPos end = kStringEnd) const override;
    SStringPos findLast(const CStringArg& text, SStringPos start = kStringBegin,
                        SStringPos end = kStringEnd) const override;
    SStringPos findChar(char32_t ch, SStringPos start = kStringBegin,
                        SStringPos end = kStringEnd) const override;
    SStringPos findLastChar(char32_t ch, SStringPos start = kStringBegin,
                            SStringPos end = kStringEnd) const override;
    SStringPos findAnyOf(const CStringArg& set, SStringPos start = kStringBegin,
                         SStringPos end = kStringEnd) const override;
    SStringPos findLastAnyOf(const CStringArg& set, SStringPos start = kStringBegin,
                             SStringPos end = kStringEnd) const override;

    P<IString> substring(SStringPos start, SStringPos end = kStringEnd) const override;
    P<IString> nextToken(SStringPos& pos, const CStringArg& separatorSet) const override;
    P<IString> nextTokenByString(SStringPos& pos, const CStringArg& separator) const override;
    P<IString> trim() const override;
    P<IString> trim(const CStringArg& characters) const override;

    P<IString> concat(const CStringArg& text) const override;
    P<IString> insert(SStringPos pos, const CStringArg& text) const override;
    P<IString> remove(SStringPos pos, int32_t count = -1) const override;
    P<IString> replaceRange(SStringPos pos, int32_t count, const CStringArg& text) const override;
    P<IString> replace(const CStringArg& search, const CStringArg& replacement,
                       SStringPos start = kStringBegin, SStringPos end = kStringEnd) const override;
    P<IString> toLower() const override;
    P<IString> toUpper() const override;

    P<IString> toCPString() const override;
    P<IString> toUTF8String() const override;
    P<IString> toUTF16String() const override;
    P<IString> toUTF32String() const override;
    P<IString> toWCharString() const override;
    P<IString> toLatin1String() const override;
    P<IString> getTerminated() const override;

    bool isEmpty() const override { return m_length == 0; }
    int32_t getLength() const override { return m_length; }
    bool isEncoding(uint32_t id) const override;
    P<ICharEncoding> getEncoding() const override { return P<ICharEncoding>::share(m_encoding.get()); }
    const uint8_t* getData() const override { return m_data; }
    int32_t getDataSize() const override { return m_byteSize; }
    bool isTerminated() const override { return m_terminated; }
    SStringView getView() const override { return view(); }

    // Allocates a terminated string and room for its bytes in one block. The caller writes the bytes
    // (getRoom) and calls settle() before anything else uses the string. Throws std::bad_alloc, also above 2
    // GB.
    static P<CString> reserve(const ICharEncoding& encoding, int64_t byteSize);
    uint8_t* getRoom() { return const_cast<uint8_t*>(m_data); }
    void settle(int32_t length = -1, bool wellFormed = false); // -1: counted

    // Unsized, since room for the bytes may follow the object.
    static void* operator new(size_t size) { return ::operator new(size); }
    static void operator delete(void* object) { ::operator delete(object); }

protected:
    // Refers to text with a counted length.
    CString(const SStringView& view, bool terminated);
    // The string that owns the bytes; a slice of a slice refers to it directly.
    virtual P<const IString> getSliceRoot() const;

private:
    struct SRoom {
        size_t byteSize;
    };
    static void* operator new(size_t size, SRoom room) { return ::operator new(size + room.byteSize); }
    static void operator delete(void* object, SRoom) { ::operator delete(object); }

    SStringView view() const {
        return {m_encoding.get(), m_encodingId, m_byteSize, m_data, m_length, m_wellFormed};
    }
    SStringPos getEnd() const { return {m_length, m_byteSize}; }
    // Returns a position with an index from 0 to the length and the matching offset.
    SStringPos resolve(SStringPos pos) const {
        if (pos.index < 0 || pos.index > m_length) return getEnd();
        if (pos.offset < 0 || pos.offset > m_byteSize) pos.offset = getOffset(pos.index);
        return pos;
    }
    int32_t getOffset(int32_t index) const;
    // The position right after `count` characters, before any malformed bytes that follow them; the end for
    // -1. `start` must be resolved.
    SStringPos getEndOf(SStringPos start, int32_t count) const;
    // Offset of the first character at or after an offset, the byte size if there is none.
    int32_t skipMalformed(int32_t offset) const;
    // Both positions must be resolved.
    SStringView getRange(SStringPos start, SStringPos end) const {
        if (start.index > end.index || start.offset > end.offset) end = start;
        return {m_encoding.get(),        m_encodingId, end.offset - start.offset, m_data + start.offset,
                end.index - start.index, m_wellFormed};
    }
    P<IString> getSlice(SStringPos start, SStringPos end) const;
    SStringPos findView(const SStringView& text, SStringPos start, SStringPos end) const;
    SStringPos findLastView(const SStringView& text, SStringPos start, SStringPos end) const;
    P<IString> edit(SStringPos start, SStringPos end, const SStringView& text) const;
    template <class F> P<IString> trimBy(F&& isTrimmed) const;
    P<IString> mapCase(char32_t (*map)(char32_t)) const;
    P<IString> convertTo(const P<ICharEncoding>& encoding, char32_t substitute) const;

    const uint8_t* m_data;
    int32_t m_byteSize; // without the terminator
    bool m_terminated;  // a terminator in the encoding's form follows the data
    bool m_owner;
    PFrail<ICharEncoding> m_encoding; // the shared encodings outlive all strings and are not counted
    int32_t m_length;                 // characters; known from construction onwards
    // The flag is set while counting; the hash is 0 until it is first requested.
    bool m_wellFormed;
    uint32_t m_encodingId;
    mutable std::atomic<uint32_t> m_hash{0};
};

// The concrete classes only add their encoding. `length` is in code units; -1 means up to the terminator.
class PERU_API CLatin1String : public CString {
public:
    using Unit = char;
    explicit CLatin1String(const char* text, int32_t length = -1,
                           EStringStorage storage = EStringStorage::copy);
};

class PERU_API CUTF8String : public CString {
public:
    using Unit = char;
    explicit CUTF8String(const char* text, int32_t length = -1,
                         EStringStorage storage = EStringStorage::copy);
};

class PERU_API CUTF16String : public CString {
public:
    using Unit = char16_t;
    explicit CUTF16String(const char16_t* text, int32_t length = -1,
                          EStringStorage storage = EStringStorage::copy);
};

class PERU_API CUTF32String : public CString {
public:
    using Unit = char32_t;
    explicit CUTF32String(const char32_t* text, int32_t length = -1,
                          EStringStorage storage = EStringStorage::copy);
};

// The platform's wide character, which is 32 bits wide on Linux.
class PERU_API CWCharString : public CString {
public:
    using Unit = wchar_t;
    explicit CWCharString(const wchar_t* text, int32_t length = -1,
                          EStringStorage storage = EStringStorage::copy);
};

// Text in the code page of the environment's locale.
class PERU_API CCPString : public CString {
public:
    using Unit = char;
    explicit CCPString(const char* text, int32_t length = -1, EStringStorage storage = EStringStorage::copy);
};

// The shared empty instance of string class S with character type C.
template <class C, class S> class PERU_API TNullString {
public:
    static const P<IString>& get();
};
extern template class TNullString<char, CLatin1String>;
extern template class TNullString<unsigned char, CCPString>;
extern template class TNullString<unsigned char, CUTF16String>;
extern template class TNullString<unsigned char, CUTF8String>;
extern template class TNullString<unsigned int, CUTF32String>;
extern template class TNullString<wchar_t, CWCharString>;

// Creates a string from a pointer; a null pointer returns the shared empty string without allocating.
PERU_API P<IString> newString(const char* latin1);
PERU_API P<IString> newString(const wchar_t* wide);
PERU_API P<IString> newString(const char16_t* wide);

namespace literals {
// A Latin-1 literal as a string object, without a copy of its bytes.
PERU_API P<IString> operator""_s(const char* text, size_t length);
} // namespace literals

// A part of another string: shares its bytes and keeps it alive.
class PERU_API CStringSlice : public CString {
public:
    // `view` refers to bytes of the parent and has a counted length.
    CStringSlice(const P<const IString>& parent, const SStringView& view, bool terminated);
    ~CStringSlice() override;

protected:
    P<const IString> getSliceRoot() const override { return m_parent; }

private:
    P<const IString> m_parent;
};

// Numbers in text. Both throw CParseError; leading and trailing white space is an error.
PERU_API int64_t parseInteger(const CStringArg& text, int base = 10);
PERU_API double parseDouble(const CStringArg& text); // the point is the decimal separator in every locale

} // namespace peru
