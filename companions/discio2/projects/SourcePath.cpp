#include "projects/SourcePath.h"
#include "Error.h"

#include <algorithm>
#include <charconv>
#include <string_view>

namespace discio {

namespace {

constexpr std::string_view kScheme = "file:";

[[noreturn]] void refuse(const std::string& text) {
    throw CDiscError(DISCIO_ERROR_INVALID_PARAM, text + " is not an absolute path or a file URI");
}

std::string decode(const std::string& uri, std::string_view rest) {
    std::string path;
    for (size_t i = 0; i < rest.size(); ++i) {
        if (rest[i] != '%') {
            path += rest[i];
            continue;
        }
        unsigned value = 0;
        const std::string_view digits = rest.substr(i + 1, 2);
        const auto end = std::from_chars(digits.data(), digits.data() + digits.size(), value, 16).ptr;
        if (digits.size() != 2 || end != digits.data() + 2 || value == 0) refuse(uri);
        path += static_cast<char>(value);
        i += 2;
    }
    return path;
}

} // namespace

std::string toSourcePath(const std::string& text) {
    std::string path = text;
    if (text.starts_with(kScheme)) {
        std::string_view rest = std::string_view(text).substr(kScheme.size());
        for (const std::string_view host : {"//localhost/", "///"})
            if (rest.starts_with(host)) rest.remove_prefix(host.size() - 1);
        path = decode(text, rest);
        if (path.starts_with("//")) refuse(text); // another machine
    } else if (text.starts_with('\\')) {
        std::replace(path.begin(), path.end(), '\\', '/');
    }
    if (!path.starts_with('/')) refuse(text);
    return path;
}

std::string toFileURI(const std::string& path) {
    constexpr std::string_view kAllowed = "/-._~!$&'()*+,;=:@";
    constexpr char kDigits[] = "0123456789ABCDEF";
    std::string uri = "file://";
    for (const char c : path) {
        const auto byte = static_cast<unsigned char>(c);
        const bool isAlphanumeric =
            (byte >= '0' && byte <= '9') || (byte >= 'A' && byte <= 'Z') || (byte >= 'a' && byte <= 'z');
        if (isAlphanumeric || kAllowed.find(c) != kAllowed.npos)
            uri += c;
        else
            (uri += '%').append({kDigits[byte >> 4], kDigits[byte & 15]});
    }
    return uri;
}

} // namespace discio
