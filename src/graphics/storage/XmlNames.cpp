#include "graphics/storage/XmlNames.h"

#include "graphics/geometry/Numbers.h"
#include "peru/xml/XmlText.h"

namespace graphics {

namespace {

constexpr std::string_view kMark = "__";
constexpr std::string_view kPrefix = "__L__";

bool isStart(char ch) {
    return (ch >= 'a' && ch <= 'z') || (ch >= 'A' && ch <= 'Z') || ch == '_' ||
           static_cast<uint8_t>(ch) >= 0x80;
}

// The size of the character at the start of the text if a name can have it, otherwise 0.
size_t measurePart(std::string_view text) {
    const char ch = text[0];
    if (!isStart(ch) && !(ch >= '0' && ch <= '9') && ch != '-' && ch != '.' && ch != ':') return 0;
    return peru::measureXmlCharacter(text);
}

bool needsPrefix(std::string_view text) {
    constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF"; // parsers skip it
    return text.empty() || !isStart(text[0]) || text.starts_with(kByteOrderMark);
}

bool isName(std::string_view text) {
    if (needsPrefix(text)) return false;
    for (size_t at = 0; at < text.size();) {
        const size_t size = measurePart(text.substr(at));
        if (size == 0) return false;
        at += size;
    }
    return true;
}

void appendEscape(std::string& name, char byte) {
    name.append(kMark).append(std::to_string(static_cast<uint8_t>(byte))).append(kMark);
}

} // namespace

std::string encodeName(const std::string& text) {
    if (isName(text) && decodeName(text) == text) return text;
    std::string name;
    if (needsPrefix(text) && (text.empty() || measurePart(text) > 0)) name = kPrefix;
    const std::string_view all = text;
    for (size_t at = 0; at < all.size();) {
        const size_t size = measurePart(all.substr(at));
        // An underscore in front of another one, or of an escape, would read as the start of an escape.
        const bool isAmbiguous = all[at] == '_' && at + 1 < all.size() &&
                                 (all[at + 1] == '_' || measurePart(all.substr(at + 1)) == 0);
        if (size == 0 || isAmbiguous)
            appendEscape(name, all[at++]);
        else
            name.append(all.substr(at, size)), at += size;
    }
    return name;
}

std::string decodeName(const std::string& name) {
    std::string text;
    std::string_view rest = name;
    if (rest.starts_with(kPrefix)) rest.remove_prefix(kPrefix.size());
    while (!rest.empty()) {
        const size_t end = rest.starts_with(kMark) ? rest.find(kMark, kMark.size()) : std::string_view::npos;
        const auto code = end == std::string_view::npos
                              ? std::nullopt
                              : parseInteger(rest.substr(kMark.size(), end - kMark.size()));
        const bool isEscape = code && *code >= 0 && *code <= 255;
        text += isEscape ? static_cast<char>(*code) : rest[0];
        rest.remove_prefix(isEscape ? end + kMark.size() : 1);
    }
    return text;
}

} // namespace graphics
