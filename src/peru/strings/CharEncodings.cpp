#include "peru/strings/CharEncodings.h"

#include "peru/Pinned.h"

#include <algorithm>
#include <string>

namespace peru {

template <class Rules>
int32_t TCharEncoding<Rules>::encodeChar(char32_t ch, uint8_t* buffer, int32_t size, int32_t pos) const {
    int32_t needed = Rules::getSize(ch);
    if (needed == 0 || pos < 0 || needed > size - pos) return pos;
    return pos + Rules::write(ch, buffer + pos);
}

template <class Rules>
int32_t TCharEncoding<Rules>::getCharSizeAt(const uint8_t* buffer, int32_t size, int32_t pos) const {
    char32_t ignored;
    int32_t length = pos < 0 ? 0 : Rules::decode(buffer + pos, size - pos, ignored);
    return length > 0 ? length : -1;
}

template <class Rules>
int32_t TCharEncoding<Rules>::countChars(const uint8_t* buffer, int32_t size, int32_t pos) const {
    pos = std::max(pos, 0);
    if constexpr (std::is_same_v<Rules, SLatin1Rules>) return std::max(size - pos, 0);
    int32_t count = 0;
    char32_t ignored;
    while (pos < size) {
        if constexpr (std::is_same_v<Rules, SUTF8Rules>) {
            uint64_t block;
            while (size - pos >= 8) {
                std::memcpy(&block, buffer + pos, 8);
                if (block & 0x8080808080808080) break;
                count += 8;
                pos += 8;
            }
        }
        int32_t length = Rules::decode(buffer + pos, size - pos, ignored);
        count += length > 0;
        pos += length > 0 ? length : Rules::kUnit;
    }
    return count;
}

template <class Rules> int32_t TCharEncoding<Rules>::getTerminatedLength(const uint8_t* buffer) const {
    if constexpr (Rules::kUnit == 1)
        return static_cast<int32_t>(std::strlen(reinterpret_cast<const char*>(buffer)));
    int32_t length = 0;
    for (static constexpr uint8_t kZeros[4] = {}; std::memcmp(buffer + length, kZeros, Rules::kUnit) != 0;)
        length += Rules::kUnit;
    return length;
}

template <class Rules>
int32_t TCharEncoding<Rules>::advance(const uint8_t* buffer, int32_t size, int32_t count) const {
    if (count < 0) return -1;
    char32_t ignored;
    for (int32_t pos = 0; pos < size;) {
        int32_t length = Rules::decode(buffer + pos, size - pos, ignored);
        if (length > 0 && count-- == 0) return pos;
        pos += length > 0 ? length : Rules::kUnit;
    }
    return -1;
}

template <class Rules>
int32_t TCharEncoding<Rules>::findValidChar(const uint8_t* buffer, int32_t size, int32_t pos) const {
    char32_t ignored;
    for (pos = std::max(pos, 0); pos < size; pos += Rules::kUnit)
        if (Rules::decode(buffer + pos, size - pos, ignored) > 0) return pos;
    return -1;
}

template <class Rules> int32_t TCharEncoding<Rules>::decodeChar(char32_t& out, const uint8_t* buffer,
                                                                int32_t size, int32_t pos) const {
    int32_t length = pos < 0 ? 0 : Rules::decode(buffer + pos, size - pos, out);
    return length > 0 ? pos + length : -1;
}

template <class Rules> int32_t TCharEncoding<Rules>::decodeNextChar(char32_t& out, const uint8_t* buffer,
                                                                    int32_t size, int32_t pos) const {
    for (pos = std::max(pos, 0); pos < size; pos += Rules::kUnit)
        if (int32_t length = Rules::decode(buffer + pos, size - pos, out)) return pos + length;
    return -1;
}

// Going back unit by unit until a strict decoding succeeds finds the same characters as going forward: no
// well-formed character contains a unit at which another one could begin.
template <class Rules> int32_t TCharEncoding<Rules>::decodePrevValidChar(char32_t& out, const uint8_t* buffer,
                                                                         int32_t size, int32_t pos) const {
    int32_t end = std::min(pos, size);
    for (int32_t start = end - end % Rules::kUnit - Rules::kUnit; start >= 0; start -= Rules::kUnit)
        if (Rules::decode(buffer + start, end - start, out) > 0) return start;
    return -1;
}

template <class Rules>
int32_t TCharEncoding<Rules>::findPrevChar(const uint8_t* buffer, int32_t size, int32_t pos) const {
    char32_t ignored;
    return TCharEncoding::decodePrevValidChar(ignored, buffer, size, pos);
}

template <class Rules> int32_t TCharEncoding<Rules>::decodePrevChar(char32_t& out, const uint8_t* buffer,
                                                                    int32_t size, int32_t pos) const {
    char32_t ch;
    if (pos > size) return -1;
    for (int32_t length = Rules::kUnit; length <= std::min(pos, Rules::kMaxCharSize);
         length += Rules::kUnit) {
        if (Rules::decode(buffer + pos - length, length, ch) != length) continue;
        out = ch;
        return pos - length;
    }
    return -1;
}

template <class Rules> int32_t TCharEncoding<Rules>::decodeChars(char32_t* out, int32_t maxCount,
                                                                 int32_t& outCount, const uint8_t* buffer,
                                                                 int32_t size, int32_t pos,
                                                                 int32_t* positions) const {
    int32_t count = 0;
    int32_t end = -1;
    for (pos = std::max(pos, 0); pos < size && count < maxCount;) {
        int32_t length = Rules::decode(buffer + pos, size - pos, out[count]);
        if (length == 0) {
            pos += Rules::kUnit;
            continue;
        }
        if (positions) positions[count] = pos;
        pos += length;
        end = pos;
        ++count;
    }
    outCount = count;
    return end;
}

template <class Rules>
int32_t TCharEncoding<Rules>::decodeCharsBackward(char32_t* out, int32_t maxCount, int32_t& outCount,
                                                  const uint8_t* buffer, int32_t size, int32_t pos,
                                                  int32_t* positions) const {
    int32_t last = -1;
    outCount = 0;
    while (outCount < maxCount) {
        pos = TCharEncoding::decodePrevValidChar(out[outCount], buffer, size, pos);
        if (pos < 0) break;
        if (positions) positions[outCount] = pos;
        last = pos;
        ++outCount;
    }
    return last;
}

template class TCharEncoding<SUTF8Rules>;
template class TCharEncoding<SUTF16Rules>;
template class TCharEncoding<SUTF32Rules>;
template class TCharEncoding<SLatin1Rules>;

namespace {

template <class E> const P<ICharEncoding>& getEncodingObject() {
    static const CGlobalObjFactory::SKey key;
    static constinit TPinned<ICharEncoding> pinned;
    return pinned.get(key, [] { return P<ICharEncoding>(make<E>()); });
}

} // namespace

const P<ICharEncoding>& getUTF8CharEncoding() {
    return getEncodingObject<CUTF8CharEncoding>();
}
const P<ICharEncoding>& getUTF16CharEncoding() {
    return getEncodingObject<CUTF16CharEncoding>();
}
const P<ICharEncoding>& getUTF32CharEncoding() {
    return getEncodingObject<CUTF32CharEncoding>();
}
const P<ICharEncoding>& getLatin1CharEncoding() {
    return getEncodingObject<CLatin1CharEncoding>();
}
const P<ICharEncoding>& getCPCharEncoding() {
    return getEncodingObject<CCPCharEncoding>();
}

} // namespace peru
