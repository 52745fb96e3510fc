#include "host_support/Guard.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/system/IPathes.h"

#include <cstdlib>
#include <filesystem>

using namespace tonewright::host_support;

namespace {

template <class Char> Char* duplicate(const std::basic_string<Char>& text) {
    const size_t size = (text.size() + 1) * sizeof(Char);
    auto* copy = static_cast<Char*>(std::malloc(size));
    if (copy) std::memcpy(copy, text.c_str(), size);
    return copy;
}

// The library's own decoder is stricter than the standard: it rejects the lead bytes E0 and F0, and thus
// every emoji. Text from hosts is therefore decoded here. Throws CError for anything but well-formed UTF-8.
std::u16string decodeUTF8(const char* text) {
    std::u16string result;
    for (const auto* byte = reinterpret_cast<const unsigned char*>(text); *byte;) {
        const unsigned char first = *byte++;
        const int more = first < 0x80 ? 0 : first >= 0xF0 ? 3 : first >= 0xE0 ? 2 : 1;
        char32_t character = more == 0 ? first : first & (0x3F >> more);
        bool isValid = more == 0 || (first >= 0xC2 && first <= 0xF4);
        for (int i = 0; isValid && i < more; ++i) {
            isValid = (*byte & 0xC0) == 0x80;
            if (isValid) character = character << 6 | (*byte++ & 0x3F);
        }
        static constexpr char32_t kLeast[] = {0, 0x80, 0x800, 0x10000};
        const bool isSurrogate = character >= 0xD800 && character < 0xE000;
        if (!isValid || character < kLeast[more] || isSurrogate || character > 0x10FFFF)
            throw peru::CError(peru::localize("tonewright.Text.notUTF8", "The text is not UTF-8"));
        if (character >= 0x10000) {
            result += static_cast<char16_t>(0xD7C0 + (character >> 10));
            character = 0xDC00 + (character & 0x3FF);
        }
        result += static_cast<char16_t>(character);
    }
    return result;
}

} // namespace

void TONEWRIGHT_Host_Free(void* memory) {
    std::free(memory);
}

char* TONEWRIGHT_Host_ToUTF8(const char16_t* text) {
    if (!text) return nullptr;
    return guard<char*>(nullptr, [&] {
        std::string utf8;
        for (const char16_t* unit = text; *unit; ++unit) {
            char32_t character = *unit;
            if (character >= 0xD800 && character < 0xE000) {
                const bool isPair = character < 0xDC00 && unit[1] >= 0xDC00 && unit[1] < 0xE000;
                character = isPair ? 0x10000 + ((character - 0xD800) << 10) + (*++unit - 0xDC00) : 0xFFFD;
            }
            if (character < 0x80) {
                utf8 += static_cast<char>(character);
                continue;
            }
            const int more = character < 0x800 ? 1 : character < 0x10000 ? 2 : 3;
            static constexpr unsigned char kLead[] = {0, 0xC0, 0xE0, 0xF0};
            utf8 += static_cast<char>(kLead[more] | character >> (6 * more));
            for (int i = more - 1; i >= 0; --i)
                utf8 += static_cast<char>(0x80 | (character >> (6 * i) & 0x3F));
        }
        return duplicate(utf8);
    });
}

char16_t* TONEWRIGHT_Host_ToUTF16(const char* text) {
    if (!text) return nullptr;
    return guard<char16_t*>(nullptr, [&] { return duplicate(decodeUTF8(text)); });
}

char16_t* TONEWRIGHT_Host_PathToURI(const char* path) {
    if (!path) return nullptr;
    return guard<char16_t*>(nullptr, [&] {
        const std::string absolute = std::filesystem::absolute(path).native();
        const P<peru::IURI> uri = peru::getPathes()->fromPlatformPath(peru::CString::fromUTF8(absolute));
        return duplicate(peru::CString::toStdU16String(uri->getAsString()));
    });
}

char* TONEWRIGHT_Host_URIToPath(const char16_t* uri) {
    if (!uri) return nullptr;
    return guard<char*>(nullptr, [&]() -> char* {
        const P<peru::IURI> parsed = tonewright::exports::toURI(uri);
        const std::string path = peru::CString::toStdString(peru::getPathes()->toPlatformPath(parsed));
        if (path.empty() || parsed->isRelative())
            throw peru::CError(
                peru::localize("tonewright.Text.notLocal", "The URI does not name a local file"));
        return duplicate(path);
    });
}

void TONEWRIGHT_Host_DestroyHandle(TONEWRIGHT_Handle handle) {
    TONEWRIGHT_DestroyHandle(handle);
}

const char16_t* TONEWRIGHT_Host_GetText(TONEWRIGHT_Handle handle) {
    return TONEWRIGHT_GetText(handle);
}

size_t TONEWRIGHT_Host_GetTextLength(TONEWRIGHT_Handle handle) {
    return TONEWRIGHT_GetTextLength(handle);
}
