#include "media/WebAddress.h"

#include <algorithm>
#include <cctype>
#include <string>
#include <string_view>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr std::string_view kScheme = "http://";

int toDigit(char c) {
    if (c >= '0' && c <= '9') return c - '0';
    const char lower = static_cast<char>(c | 0x20);
    return lower >= 'a' && lower <= 'f' ? lower - 'a' + 10 : -1;
}

std::string unescape(const std::string& text) {
    std::string result;
    for (size_t i = 0; i < text.size(); ++i) {
        const bool isEscape =
            text[i] == '%' && i + 2 < text.size() && toDigit(text[i + 1]) >= 0 && toDigit(text[i + 2]) >= 0;
        result += isEscape ? static_cast<char>(toDigit(text[i + 1]) << 4 | toDigit(text[i + 2])) : text[i];
        if (isEscape) i += 2;
    }
    return result;
}

} // namespace

bool isWebAddress(const fs::path& file) {
    const std::string start = file.native().substr(0, kScheme.size());
    return start.size() == kScheme.size() &&
           std::equal(start.begin(), start.end(), kScheme.begin(),
                      [](char a, char b) { return std::tolower(static_cast<unsigned char>(a)) == b; });
}

fs::path getWebName(const fs::path& address) {
    std::string path = address.native().substr(std::min(kScheme.size(), address.native().size()));
    path.resize(std::min(path.find_first_of("?#"), path.size()));
    const size_t slash = path.rfind('/');
    const std::string name = slash == std::string::npos ? "" : unescape(path.substr(slash + 1));
    const bool isUsable = name != "." && name != ".." && name.find('/') == std::string::npos &&
                          name.find('\0') == std::string::npos;
    return isUsable ? name : "";
}

} // namespace host
