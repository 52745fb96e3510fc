#include "filetag/Text.h"

#include <cwchar>
#include <locale>
#include <string>

namespace filetag {

namespace {

// 0x80 to 0x9F in code page 1252. The five undefined bytes map to the control characters of Latin-1.
constexpr char16_t kWindowsCharacters[] = {0x20AC, 0x0081, 0x201A, 0x0192, 0x201E, 0x2026, 0x2020, 0x2021,
                                           0x02C6, 0x2030, 0x0160, 0x2039, 0x0152, 0x008D, 0x017D, 0x008F,
                                           0x0090, 0x2018, 0x2019, 0x201C, 0x201D, 0x2022, 0x2013, 0x2014,
                                           0x02DC, 0x2122, 0x0161, 0x203A, 0x0153, 0x009D, 0x017E, 0x0178};

// Returns false if the bytes are not valid UTF-8.
bool decodeUTF8(std::string_view bytes, std::u16string& text) {
    using Converter = std::codecvt<char16_t, char8_t, std::mbstate_t>;
    const Converter& converter = std::use_facet<Converter>(std::locale::classic());
    const auto* begin = reinterpret_cast<const char8_t*>(bytes.data());
    const char8_t* const end = begin + bytes.size();
    text.resize(bytes.size());
    const char8_t* stop = begin;
    char16_t* last = text.data();
    std::mbstate_t state{};
    const auto result = converter.in(state, begin, end, stop, text.data(), text.data() + text.size(), last);
    text.resize(static_cast<size_t>(last - text.data()));
    return result == std::codecvt_base::ok && stop == end;
}

} // namespace

P<peru::IString> readNarrowText(std::string_view bytes) {
    if (bytes.empty()) return peru::CString::empty();
    std::u16string text;
    if (!decodeUTF8(bytes, text)) {
        text.clear();
        for (const char character : bytes) {
            const auto byte = static_cast<uint8_t>(character);
            text += byte >= 0x80 && byte < 0xA0 ? kWindowsCharacters[byte - 0x80] : char16_t{byte};
        }
    }
    return peru::CString::fromUTF16(text.data(), static_cast<int32_t>(text.size()));
}

} // namespace filetag
