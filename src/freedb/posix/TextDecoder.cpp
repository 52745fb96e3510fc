#include "freedb/TextDecoder.h"

#include "peru/strings/UTF8.h"

#include <array>
#include <cerrno>
#include <iconv.h>
#include <optional>

namespace freedb {

namespace {

bool isUTF8(std::string_view text) {
    while (!text.empty()) {
        const size_t size = peru::measureUTF8Character(text);
        if (size == 0) return false;
        text.remove_prefix(size);
    }
    return true;
}

// Empty if the encoding is unknown or the text is not valid in it.
std::optional<std::string> convert(const std::string& encoding, std::string_view bytes) {
    if (encoding.empty()) return std::nullopt;
    const iconv_t converter = ::iconv_open("UTF-8", encoding.c_str());
    if (converter == reinterpret_cast<iconv_t>(-1)) return std::nullopt;
    std::string source(bytes), text;
    char* in = source.data();
    size_t left = source.size();
    bool isValid = true, isFlushed = false;
    while (isValid && !isFlushed) {
        std::array<char, 4096> block;
        char* out = block.data();
        size_t room = block.size();
        // With all input converted, a last call ends the shift state.
        isFlushed = left == 0;
        const size_t result = ::iconv(converter, isFlushed ? nullptr : &in, &left, &out, &room);
        text.append(block.data(), block.size() - room);
        isValid = result != static_cast<size_t>(-1) || errno == E2BIG;
    }
    ::iconv_close(converter);
    return isValid ? std::optional(text) : std::nullopt;
}

// Every byte as the code point of the same number.
std::string fromLatin1(std::string_view bytes) {
    std::string text;
    for (const char c : bytes) {
        const auto code = static_cast<unsigned char>(c);
        if (code < 0x80) {
            text += c;
        } else {
            text += static_cast<char>(0xC0 | code >> 6);
            text += static_cast<char>(0x80 | (code & 0x3F));
        }
    }
    return text;
}

bool isLatin1(const std::string& encoding) {
    std::string name;
    for (const char c : encoding)
        if (c != '-' && c != '_') name += static_cast<char>(c >= 'A' && c <= 'Z' ? c | 0x20 : c);
    return name == "iso88591" || name == "latin1" || name == "usascii" || name == "ascii";
}

} // namespace

// What claims to be Latin-1 is usually Windows-1252, which only adds characters to it.
CTextDecoder::CTextDecoder(std::string set, std::string stated)
    : m_set(std::move(set)), m_stated(isLatin1(stated) ? "" : std::move(stated)) {}

std::string CTextDecoder::decode(std::string_view bytes) const {
    std::optional<std::string> text;
    if (isUTF8(bytes)) text = std::string(bytes);
    for (const std::string& encoding : {m_set, m_stated, std::string("WINDOWS-1252")})
        if (!text) text = convert(encoding, bytes);
    if (!text) text = fromLatin1(bytes);
    for (size_t i = 0; i < text->size(); ++i) {
        const auto c = static_cast<unsigned char>((*text)[i]);
        if (c < 0x20 || c == 0x7F) (*text)[i] = ' ';
    }
    return *text;
}

} // namespace freedb
