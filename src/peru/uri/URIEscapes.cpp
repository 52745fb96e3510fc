#include "peru/uri/URIEscapes.h"

#include <cstdint>

namespace peru::uri {

namespace {

constexpr char kHexDigits[] = "0123456789ABCDEF";

// A set of ASCII characters as a bit map.
class CCharSet {
public:
    constexpr CCharSet() = default;
    constexpr explicit CCharSet(std::string_view characters) {
        for (char c : characters) add(static_cast<uint8_t>(c));
    }
    constexpr void add(uint8_t c) {
        if (c < 128) m_bits[c / 64] |= uint64_t{1} << (c % 64);
    }
    constexpr bool has(uint8_t c) const { return c < 128 && (m_bits[c / 64] >> (c % 64) & 1); }

private:
    uint64_t m_bits[2] = {};
};

constexpr std::string_view kAlwaysKept =
    "0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz-_.!~*'()";
int hexValue(char c) {
    if (c >= '0' && c <= '9') return c - '0';
    if (c >= 'a' && c <= 'f') return c - 'a' + 10;
    if (c >= 'A' && c <= 'F') return c - 'A' + 10;
    return -1;
}

bool isEscapeAt(std::string_view text, size_t at) {
    return text[at] == '%' && at + 2 < text.size() && hexValue(text[at + 1]) >= 0 &&
           hexValue(text[at + 2]) >= 0;
}

void appendEscaped(std::string& out, uint8_t byte) {
    out += '%';
    out += kHexDigits[byte >> 4];
    out += kHexDigits[byte & 15];
}

} // namespace

std::string escapeBytes(std::string_view bytes, std::string_view keptCharacters, EPercent percent) {
    CCharSet kept(kAlwaysKept);
    for (char c : keptCharacters) kept.add(static_cast<uint8_t>(c));
    std::string out;
    out.reserve(bytes.size());
    for (size_t i = 0; i < bytes.size(); ++i) {
        const uint8_t byte = static_cast<uint8_t>(bytes[i]);
        if (kept.has(byte) || (percent == EPercent::keepEscapes && isEscapeAt(bytes, i)))
            out += bytes[i];
        else
            appendEscaped(out, byte);
    }
    return out;
}

std::string escapeUnprintable(std::string_view bytes) {
    std::string out;
    out.reserve(bytes.size());
    for (char c : bytes) {
        const uint8_t byte = static_cast<uint8_t>(c);
        if (byte < 0x20 || byte >= 0x7F)
            appendEscaped(out, byte);
        else
            out += c;
    }
    return out;
}

std::string unescapeBytes(std::string_view text) {
    std::string out;
    out.reserve(text.size());
    for (size_t i = 0; i < text.size(); ++i) {
        if (isEscapeAt(text, i)) {
            out += static_cast<char>(hexValue(text[i + 1]) << 4 | hexValue(text[i + 2]));
            i += 2;
        } else {
            out += text[i];
        }
    }
    return out;
}

} // namespace peru::uri
