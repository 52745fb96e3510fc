#include "peru/xml/XmlText.h"

#include "peru/Errors.h"
#include "peru/strings/CharEncodingRules.h"

#include <algorithm>

namespace peru {

namespace {

// The code point of a well-formed sequence of `size` bytes.
char32_t decode(const char* text, size_t size) {
    const auto byte = [&](size_t index) { return static_cast<uint8_t>(text[index]); };
    if (size == 1) return byte(0);
    char32_t ch = byte(0) & (0xFF >> (size + 1));
    for (size_t i = 1; i < size; ++i) ch = ch << 6 | (byte(i) & 0x3F);
    return ch;
}

std::u16string toUTF16(std::string_view utf8) {
    std::u16string units;
    units.reserve(utf8.size());
    for (size_t at = 0; at < utf8.size();) {
        const size_t size = std::max<size_t>(measureXmlCharacter(utf8.substr(at, 4)), 1);
        uint8_t bytes[4];
        const int32_t written = SUTF16Rules::write(decode(utf8.data() + at, size), bytes);
        for (int32_t i = 0; i < written; i += 2) units.push_back(SUTF16Rules::load(bytes + i));
        at += size;
    }
    return units;
}

void appendUTF8(std::string& out, char32_t ch) {
    uint8_t bytes[4];
    out.append(reinterpret_cast<const char*>(bytes), static_cast<size_t>(SUTF8Rules::write(ch, bytes)));
}

} // namespace

size_t measureXmlCharacter(std::string_view text) {
    if (text.empty()) return 0;
    const auto byte = [&](size_t index) { return static_cast<uint8_t>(text[index]); };
    const uint8_t lead = byte(0);
    if (lead < 0x80) return lead >= 0x20 || lead == '\t' || lead == '\n' || lead == '\r' ? 1 : 0;
    const size_t size = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : 2;
    if (lead < 0xC2 || lead > 0xF4 || text.size() < size) return 0;
    for (size_t i = 1; i < size; ++i)
        if ((byte(i) & 0xC0) != 0x80) return 0;
    const char32_t ch = decode(text.data(), size);
    const char32_t smallest = size == 2 ? 0x80 : size == 3 ? 0x800 : 0x10000;
    const bool surrogate = ch >= 0xD800 && ch <= 0xDFFF;
    return ch < smallest || ch > kMaxCodePoint || surrogate || ch == 0xFFFE || ch == 0xFFFF ? 0 : size;
}

namespace xml {

bool isNameStart(char byte) {
    const char letter = static_cast<char>(byte | 0x20);
    return (letter >= 'a' && letter <= 'z' && byte > 0) || byte == '_' || static_cast<uint8_t>(byte) >= 0x80;
}

bool isNamePart(char byte) {
    return isNameStart(byte) || (byte >= '0' && byte <= '9') || byte == '-' || byte == '.' || byte == ':';
}

bool isBlank(char byte) {
    return byte == ' ' || byte == '\n' || byte == '\r' || byte == '\t';
}

P<IString> toString(std::string_view utf8) {
    const bool refused = std::any_of(utf8.begin(), utf8.end(), [](char byte) {
        return static_cast<uint8_t>(byte) == 0xE0 || static_cast<uint8_t>(byte) == 0xF0;
    });
    if (!refused) return CString::fromUTF8(utf8);
    const std::u16string units = toUTF16(utf8);
    return CString::fromUTF16(units.data(), static_cast<int32_t>(units.size()));
}

std::string fromText(const CStringArg& text, const char* method) {
    std::string bytes = CString::toStdString(text);
    const std::string_view all = bytes;
    for (size_t at = 0; at < all.size();) {
        const size_t size = measureXmlCharacter(all.substr(at, 4));
        if (size == 0) throw CInvalidArgError("the text has characters that XML cannot hold", method);
        at += size;
    }
    return bytes;
}

std::string fromName(const CStringArg& name, const char* method) {
    std::string bytes = fromText(name, method);
    if (bytes.empty() || !isNameStart(bytes[0]) || !std::all_of(bytes.begin(), bytes.end(), isNamePart))
        throw CInvalidArgError(newString("'") + toString(bytes) + "' is no name of XML", method);
    return bytes;
}

bool decodeUTF16(std::string_view bytes, bool bigEndian, std::string& out) {
    const auto unitAt = [&](size_t at) {
        const auto first = static_cast<uint8_t>(bytes[at]);
        const auto second = static_cast<uint8_t>(bytes[at + 1]);
        return static_cast<char32_t>(bigEndian ? first << 8 | second : second << 8 | first);
    };
    out.clear();
    out.reserve(bytes.size() / 2);
    for (size_t at = 0; at < bytes.size(); at += 2) {
        if (bytes.size() - at < 2) return false;
        char32_t ch = unitAt(at);
        if (SUTF16Rules::isSurrogate(ch)) {
            if (!SUTF16Rules::isHigh(ch) || bytes.size() - at < 4) return false;
            const char32_t low = unitAt(at + 2);
            if (!SUTF16Rules::isLow(low)) return false;
            ch = 0x10000 + ((ch - 0xD800) << 10) + (low - 0xDC00);
            at += 2;
        }
        appendUTF8(out, ch);
    }
    return true;
}

std::string decodeLatin1(std::string_view bytes) {
    std::string out;
    out.reserve(bytes.size() + bytes.size() / 8);
    for (char byte : bytes) appendUTF8(out, static_cast<uint8_t>(byte));
    return out;
}

std::string encodeUTF16(std::string_view utf8) {
    const std::u16string units = toUTF16(utf8);
    std::string out;
    out.reserve(units.size() * 2);
    for (char16_t unit : units) {
        out.push_back(static_cast<char>(unit & 0xFF));
        out.push_back(static_cast<char>(unit >> 8));
    }
    return out;
}

} // namespace xml

} // namespace peru
