#include "peru/uri/WindowsPath.h"

#include "peru/Errors.h"
#include "peru/strings/StringFormat.h"
#include "peru/uri/URI.h"

#include <algorithm>

namespace peru {
namespace {

constexpr std::string_view kLongPrefix = "\\\\?\\";
constexpr std::string_view kLongUNCPrefix = "UNC\\";
constexpr std::string_view kUNCStart = "\\\\";

bool hasDrive(std::string_view path) {
    return path.size() >= 2 && path[1] == ':';
}

// Counts UTF-16 units from the bytes: the platform also counts characters that the strict decoder of strings
// would skip.
size_t countUnits(std::string_view utf8) {
    size_t units = 0;
    for (char ch : utf8) {
        auto byte = static_cast<uint8_t>(ch);
        if ((byte & 0xC0) != 0x80) units += byte >= 0xF0 ? 2 : 1;
    }
    return units;
}

bool startsWithIgnoreCase(std::string_view text, std::string_view prefix) {
    return CString::fromUTF8(text.substr(0, prefix.size()))->equalsIgnoreCase(CString::fromUTF8(prefix));
}

} // namespace

P<IString> toWindowsPath(const P<IURI>& uri, bool knowsLongForm) {
    if (!uri || (uri->hasScheme() && !uri->getScheme()->equalsIgnoreCase("file"))) return CString::empty();
    std::string path = CString::toStdString(uri->getUnescapedPath());
    if (path.starts_with('/')) path.erase(0, 1);
    std::string host = CString::toStdString(uri->getHost());
    if (!host.empty()) path = std::string(kUNCStart) + host + "\\" + path;
    std::replace(path.begin(), path.end(), '/', '\\');

    P<IString> text = CString::fromUTF8(path);
    if (countUnits(path) < kWindowsPathLimit) return text;
    if (knowsLongForm && path.starts_with(kUNCStart))
        return CString::fromUTF8(std::string(kLongPrefix) + std::string(kLongUNCPrefix) +
                                 path.substr(kUNCStart.size()));
    if (knowsLongForm && hasDrive(path)) return CString::fromUTF8(std::string(kLongPrefix) + path);
    throw CError(format("Error: Windows path is longer than MAX_PATH and the limit cannot be circumvented "
                        "(path='%s')",
                        text));
}

P<IURI> fromWindowsPath(const CStringArg& path) {
    std::string text = CString::toStdString(path);
    if (text.starts_with(kLongPrefix)) {
        text.erase(0, kLongPrefix.size());
        if (startsWithIgnoreCase(text, kLongUNCPrefix)) text.replace(0, kLongUNCPrefix.size(), kUNCStart);
    }
    std::replace(text.begin(), text.end(), '\\', '/');
    std::string scheme = "file";
    std::string host;
    if (text.starts_with("//")) {
        size_t end = std::min(text.find('/', 2), text.size());
        host = text.substr(2, end - 2);
        text.erase(0, end);
    } else if (hasDrive(text)) {
        text.insert(0, "/");
    } else {
        scheme.clear();
    }
    return make<CURI>(CString::fromUTF8(scheme), CString::fromUTF8(host), "", "", CString::fromUTF8(text), "",
                      "");
}

} // namespace peru
