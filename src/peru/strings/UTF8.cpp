#include "peru/strings/UTF8.h"

#include "peru/strings/CharEncodingRules.h"

namespace peru {

char32_t decodeUTF8Character(const char* text, size_t size) {
    const auto byte = [&](size_t index) { return static_cast<uint8_t>(text[index]); };
    if (size == 1) return byte(0);
    char32_t ch = byte(0) & (0xFF >> (size + 1));
    for (size_t i = 1; i < size; ++i) ch = ch << 6 | (byte(i) & 0x3F);
    return ch;
}

size_t measureUTF8Character(std::string_view text) {
    if (text.empty()) return 0;
    const auto lead = static_cast<uint8_t>(text[0]);
    if (lead < 0x80) return 1;
    const size_t size = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : 2;
    if (lead < 0xC2 || lead > 0xF4 || text.size() < size) return 0;
    for (size_t i = 1; i < size; ++i)
        if (!SUTF8Rules::isTrail(static_cast<uint8_t>(text[i]))) return 0;
    const char32_t ch = decodeUTF8Character(text.data(), size);
    const char32_t smallest = size == 2 ? 0x80 : size == 3 ? 0x800 : 0x10000;
    return ch < smallest || ch > kMaxCodePoint || SUTF16Rules::isSurrogate(ch) ? 0 : size;
}

std::string makeValidUTF8(std::string_view text) {
    std::string valid;
    valid.reserve(text.size());
    while (!text.empty()) {
        const size_t size = measureUTF8Character(text);
        valid.append(size ? text.substr(0, size) : "\xEF\xBF\xBD");
        text.remove_prefix(size ? size : 1);
    }
    return valid;
}

} // namespace peru
