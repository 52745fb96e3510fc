// The per-encoding strategy of strings.
#pragma once

#include "peru/P.h"

#include <cstdint>

namespace peru {

// Stateless; one shared object per encoding. `size` and `pos` are in bytes. Decoding operations return the
// byte offset after the character, or of the character when reading backwards, or -1.
class PERU_API ICharEncoding : public virtual IBase {
public:
    enum EId : uint32_t {
        kUTF8 = 0x38465455,
        kUTF16 = 0x36314655,
        kUTF32 = 0x32334655,
        kLatin1 = 0x3154414C,
        kCodePage = 0x47504443,
    };

    virtual uint32_t getId() const = 0;
    virtual const char* getName() const = 0;
    virtual int32_t getMaxCharSize() const = 0;

    // Returns the new position, or `pos` if the code point does not fit or cannot be encoded.
    virtual int32_t encodeChar(char32_t ch, uint8_t* buffer, int32_t size, int32_t pos) const = 0;
    // Bytes that `ch` needs, 0 if it cannot be encoded.
    virtual int32_t getEncodedSize(char32_t ch) const = 0;

    // Length of the character at `pos`, -1 if there is none or it is malformed.
    virtual int32_t getCharSizeAt(const uint8_t* buffer, int32_t size, int32_t pos) const = 0;
    // Characters from `pos` to the end; malformed bytes are skipped and not counted.
    virtual int32_t countChars(const uint8_t* buffer, int32_t size, int32_t pos) const = 0;
    // Byte length of zero-terminated text.
    virtual int32_t getTerminatedLength(const uint8_t* buffer) const = 0;
    // Position of the character with the index `count`, malformed bytes skipped; -1 if there are fewer.
    virtual int32_t advance(const uint8_t* buffer, int32_t size, int32_t count) const = 0;
    // First position at or after `pos` where a well-formed character starts, -1 if none.
    virtual int32_t findValidChar(const uint8_t* buffer, int32_t size, int32_t pos) const = 0;

    // Strict: the character at `pos` itself.
    virtual int32_t decodeChar(char32_t& out, const uint8_t* buffer, int32_t size, int32_t pos) const = 0;
    // The same, skipping malformed bytes first.
    virtual int32_t decodeNextChar(char32_t& out, const uint8_t* buffer, int32_t size, int32_t pos) const = 0;

    // True for the Unicode encodings.
    virtual bool isUnicode() const = 0;

    // Reading backwards. The code page throws CMethodNotImplementedError in all four operations.
    virtual int32_t findPrevChar(const uint8_t* buffer, int32_t size, int32_t pos) const = 0;
    virtual int32_t decodePrevChar(char32_t& out, const uint8_t* buffer, int32_t size, int32_t pos) const = 0;
    virtual int32_t decodePrevValidChar(char32_t& out, const uint8_t* buffer, int32_t size,
                                        int32_t pos) const = 0;

    // Decodes up to maxCount characters from `pos`, malformed bytes skipped; `positions`, unless null,
    // receives the byte offset of each. Returns the position after the last one, -1 if there was none.
    virtual int32_t decodeChars(char32_t* out, int32_t maxCount, int32_t& outCount, const uint8_t* buffer,
                                int32_t size, int32_t pos, int32_t* positions) const = 0;
    virtual int32_t decodeCharsBackward(char32_t* out, int32_t maxCount, int32_t& outCount,
                                        const uint8_t* buffer, int32_t size, int32_t pos,
                                        int32_t* positions) const = 0;
};

// The shared encodings. Cheap: no lock after the first call.
PERU_API const P<ICharEncoding>& getUTF8CharEncoding();
PERU_API const P<ICharEncoding>& getUTF16CharEncoding();
PERU_API const P<ICharEncoding>& getUTF32CharEncoding();
PERU_API const P<ICharEncoding>& getLatin1CharEncoding();
PERU_API const P<ICharEncoding>& getCPCharEncoding();

} // namespace peru
