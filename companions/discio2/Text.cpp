#include "Text.h"

#include <cstdint>

namespace discio {

namespace {

// The length of the well-formed sequence at the start, 0 if there is none.
size_t decode(std::string_view text, char32_t& character) {
    const auto lead = static_cast<uint8_t>(text[0]);
    if (lead < 0x80) {
        character = lead;
        return 1;
    }
    const size_t length = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : 2;
    if (lead < 0xC2 || lead > 0xF4 || text.size() < length) return 0;
    character = lead & (0x7F >> length);
    for (size_t i = 1; i < length; ++i) {
        const auto byte = static_cast<uint8_t>(text[i]);
        if ((byte & 0xC0) != 0x80) return 0;
        character = character << 6 | (byte & 0x3F);
    }
    const char32_t least = length == 4 ? 0x10000 : length == 3 ? 0x800 : 0x80;
    const bool isSurrogate = character >= 0xD800 && character < 0xE000;
    return character < least || character > 0x10FFFF || isSurrogate ? 0 : length;
}

} // namespace

std::u16string toUTF16(std::string_view utf8) {
    std::u16string text;
    while (!utf8.empty()) {
        char32_t character = 0;
        size_t length = decode(utf8, character);
        if (length == 0) {
            character = 0xDC00 + static_cast<uint8_t>(utf8[0]);
            length = 1;
        }
        if (character >= 0x10000) {
            text += static_cast<char16_t>(0xD7C0 + (character >> 10));
            text += static_cast<char16_t>(0xDC00 + (character & 0x3FF));
        } else {
            text += static_cast<char16_t>(character);
        }
        utf8.remove_prefix(length);
    }
    return text;
}

std::string toUTF8(std::u16string_view utf16) {
    std::string text;
    for (size_t i = 0; i < utf16.size(); ++i) {
        char32_t c = utf16[i];
        const bool isPair = c >= 0xD800 && c < 0xDC00 && i + 1 < utf16.size() && utf16[i + 1] >= 0xDC00 &&
                            utf16[i + 1] < 0xE000;
        if (isPair) c = 0x10000 + ((c & 0x3FF) << 10 | (utf16[++i] & 0x3FF));
        if (!isPair && c >= 0xDC80 && c <= 0xDCFF) {
            text += static_cast<char>(c & 0xFF);
        } else if (c < 0x80) {
            text += static_cast<char>(c);
        } else {
            if (!isPair && c >= 0xD800 && c < 0xE000) c = 0xFFFD;
            if (c >= 0x10000) {
                text += static_cast<char>(0xF0 | c >> 18);
                text += static_cast<char>(0x80 | (c >> 12 & 0x3F));
            } else if (c >= 0x800) {
                text += static_cast<char>(0xE0 | c >> 12);
            }
            text += static_cast<char>(c < 0x800 ? 0xC0 | c >> 6 : 0x80 | (c >> 6 & 0x3F));
            text += static_cast<char>(0x80 | (c & 0x3F));
        }
    }
    return text;
}

} // namespace discio
