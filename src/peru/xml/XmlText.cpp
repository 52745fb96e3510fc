#include "peru/xml/XmlText.h"

#include "peru/Errors.h"
#include "peru/strings/CharEncodingRules.h"
#include "peru/strings/UTF8.h"

#include <algorithm>

namespace peru {

namespace {

bool isSpace(char byte) {
    return byte == '\n' || byte == '\r' || byte == '\t';
}

void appendUTF8(std::string& out, char32_t ch) {
    uint8_t bytes[4];
    out.append(reinterpret_cast<const char*>(bytes), static_cast<size_t>(SUTF8Rules::write(ch, bytes)));
}

} // namespace

size_t measureXmlCharacter(std::string_view text) {
    const size_t size = measureUTF8Character(text);
    if (size == 1) return text[0] >= 0x20 || isSpace(text[0]) ? 1 : 0;
    return text.starts_with("\xEF\xBF\xBE") || text.starts_with("\xEF\xBF\xBF") ? 0 : size;
}

namespace xml {

bool isNameStart(char byte) {
    const char letter = static_cast<char>(byte | 0x20);
    return (letter >= 'a' && letter <= 'z' && byte > 0) || byte == '_' || static_cast<uint8_t>(byte) >= 0x80;
}

bool isNamePart(char byte) {
    return isNameStart(byte) || (byte >= '0' && byte <= '9') || byte == '-' || byte == '.' || byte == ':';
}

bool startsName(std::string_view text) {
    return !text.empty() && isNameStart(text[0]) && !text.starts_with(kMark);
}

bool isBlank(char byte) {
    return byte == ' ' || isSpace(byte);
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
    if (!startsName(bytes) || !std::all_of(bytes.begin(), bytes.end(), isNamePart))
        throw CInvalidArgError(newString("'") + CString::fromUTF8(bytes) + "' is not a valid XML name",
                               method);
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
    const std::u16string units = CString::toStdU16String(CString::fromUTF8(utf8));
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
