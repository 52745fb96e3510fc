// The encodings of strings.
#pragma once

#include "peru/Object.h"
#include "peru/strings/CharEncodingRules.h"

namespace peru {

// Implements all operations of an encoding that can be read in both directions, from its rules.
template <class Rules> class PERU_API TCharEncoding : public CObject, public ICharEncoding {
public:
    uint32_t getId() const override { return Rules::kId; }
    const char* getName() const override { return Rules::kName; }
    int32_t getMaxCharSize() const override { return Rules::kMaxCharSize; }
    int32_t encodeChar(char32_t ch, uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t getEncodedSize(char32_t ch) const override { return Rules::getSize(ch); }
    int32_t getCharSizeAt(const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t countChars(const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t getTerminatedLength(const uint8_t* buffer) const override;
    int32_t advance(const uint8_t* buffer, int32_t size, int32_t count) const override;
    int32_t findValidChar(const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t decodeChar(char32_t& out, const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t decodeNextChar(char32_t& out, const uint8_t* buffer, int32_t size, int32_t pos) const override;
    bool isUnicode() const override { return Rules::kUnicode; }
    int32_t findPrevChar(const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t decodePrevChar(char32_t& out, const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t decodePrevValidChar(char32_t& out, const uint8_t* buffer, int32_t size,
                                int32_t pos) const override;
    int32_t decodeChars(char32_t* out, int32_t maxCount, int32_t& outCount, const uint8_t* buffer,
                        int32_t size, int32_t pos, int32_t* positions) const override;
    int32_t decodeCharsBackward(char32_t* out, int32_t maxCount, int32_t& outCount, const uint8_t* buffer,
                                int32_t size, int32_t pos, int32_t* positions) const override;
};

class PERU_API CUTF8CharEncoding : public TCharEncoding<SUTF8Rules> {};
class PERU_API CUTF16CharEncoding : public TCharEncoding<SUTF16Rules> {};
class PERU_API CUTF32CharEncoding : public TCharEncoding<SUTF32Rules> {};
class PERU_API CLatin1CharEncoding : public TCharEncoding<SLatin1Rules> {};

// The multi-byte text of the environment's locale (getCodePageLocale), whatever locale the process has set.
// Shift states are not kept between characters. It can only be read forwards.
class PERU_API CCPCharEncoding : public CObject, public ICharEncoding {
public:
    uint32_t getId() const override { return kCodePage; }
    const char* getName() const override { return "CodePage"; }
    int32_t getMaxCharSize() const override;
    int32_t encodeChar(char32_t ch, uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t getEncodedSize(char32_t ch) const override;
    int32_t getCharSizeAt(const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t countChars(const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t getTerminatedLength(const uint8_t* buffer) const override;
    int32_t advance(const uint8_t* buffer, int32_t size, int32_t count) const override;
    int32_t findValidChar(const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t decodeChar(char32_t& out, const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t decodeNextChar(char32_t& out, const uint8_t* buffer, int32_t size, int32_t pos) const override;
    bool isUnicode() const override { return false; }
    int32_t findPrevChar(const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t decodePrevChar(char32_t& out, const uint8_t* buffer, int32_t size, int32_t pos) const override;
    int32_t decodePrevValidChar(char32_t& out, const uint8_t* buffer, int32_t size,
                                int32_t pos) const override;
    int32_t decodeChars(char32_t* out, int32_t maxCount, int32_t& outCount, const uint8_t* buffer,
                        int32_t size, int32_t pos, int32_t* positions) const override;
    int32_t decodeCharsBackward(char32_t* out, int32_t maxCount, int32_t& outCount, const uint8_t* buffer,
                                int32_t size, int32_t pos, int32_t* positions) const override;
};

} // namespace peru
