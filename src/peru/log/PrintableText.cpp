#include "peru/log/PrintableText.h"

#include "peru/strings/UTF8.h"

namespace peru {

namespace {

// U+0000 to U+001F and U+007F to U+009F.
bool isControl(char32_t ch) {
    return ch < 0x20 ? ch != '\t' && ch != '\n' && ch != '\r' : ch >= 0x7F && ch < 0xA0;
}

} // namespace

std::string makePrintable(std::string_view utf8) {
    constexpr char kDigits[] = "0123456789ABCDEF";
    std::string text;
    text.reserve(utf8.size());
    for (size_t at = 0; at < utf8.size();) {
        size_t size = measureUTF8Character(utf8.substr(at, 4));
        const char32_t ch =
            size > 0 ? decodeUTF8Character(utf8.data() + at, size) : static_cast<unsigned char>(utf8[at]);
        if (size > 0 && !isControl(ch)) {
            text += utf8.substr(at, size);
        } else {
            size = size > 0 ? size : 1;
            text.append("\\x").append(1, kDigits[ch >> 4]).append(1, kDigits[ch & 15]);
        }
        at += size;
    }
    return text;
}

} // namespace peru
