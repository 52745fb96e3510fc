#include "peru/system/posix/Pathes.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/strings/UTF8.h"
#include "peru/uri/URI.h"

#include <cstdlib>

namespace peru::posix {
namespace {

bool isNameStart(char ch) {
    return (ch >= 'A' && ch <= 'Z') || (ch >= 'a' && ch <= 'z') || ch == '_';
}

bool isNameCharacter(char ch) {
    return isNameStart(ch) || (ch >= '0' && ch <= '9');
}

bool isName(std::string_view text) {
    if (text.empty() || !isNameStart(text[0])) return false;
    for (char ch : text)
        if (!isNameCharacter(ch)) return false;
    return true;
}

bool isHere(const P<IURI>& uri) {
    if (uri->hasScheme() && !uri->getScheme()->equalsIgnoreCase("file")) return false;
    return !uri->hasHost() || uri->getHost()->isEmpty() || uri->getHost()->equalsIgnoreCase("localhost");
}

// False if a "${" is not closed.
bool expand(const std::string& text, std::string& result) {
    result.clear();
    size_t pos = 0;
    while (pos < text.size()) {
        size_t dollar = text.find('$', pos);
        if (dollar == std::string::npos) break;
        result.append(text, pos, dollar - pos);
        bool braced = text.compare(dollar + 1, 1, "{") == 0;
        size_t start = dollar + (braced ? 2 : 1);
        size_t end = start;
        if (braced) {
            end = text.find('}', start);
            if (end == std::string::npos) return false;
        } else {
            while (end < text.size() && isNameCharacter(text[end])) ++end;
        }
        std::string name = text.substr(start, end - start);
        pos = end + (braced ? 1 : 0);
        const char* value = isName(name) ? std::getenv(name.c_str()) : nullptr;
        if (value)
            result += value;
        else
            result.append(text, dollar, pos - dollar);
    }
    result.append(text, pos);
    return true;
}

} // namespace

P<IString> CPathes::toPlatformPath(const P<IURI>& uri, bool forDisplay) {
    if (!uri || !uri->hasPath() || !isHere(uri)) return CString::empty();
    std::string path = CString::toStdString(uri->getUnescapedPath());
    // A path ends at its first zero byte, so such a URI would name a different file.
    if (path.find('\0') != std::string::npos) return CString::empty();
    return CString::fromUTF8(forDisplay ? makeValidUTF8(path) : path);
}

P<IURI> CPathes::fromPlatformPath(const CStringArg& path) {
    const std::string bytes = CString::toStdString(path);
    const char* scheme = bytes.starts_with('/') ? "file" : "";
    return make<CURI>(scheme, "", "", "", CString::fromUTF8(bytes), "", "");
}

P<IString> CPathes::join(const CStringArg& folder, const CStringArg& fileName) {
    std::string path = CString::toStdString(folder);
    std::string name = CString::toStdString(fileName);
    if (path.empty()) return CString::fromUTF8(name);
    if (name.empty()) return CString::fromUTF8(path);
    if (!path.ends_with('/')) path += '/';
    size_t start = name.find_first_not_of('/');
    return CString::fromUTF8(start == std::string::npos ? path : path + name.substr(start));
}

void CPathes::split(const CStringArg& path, P<IString>& folder, P<IString>& fileName) {
    std::string bytes = CString::toStdString(path);
    size_t nameStart = bytes.rfind('/') + 1; // npos + 1 is 0
    folder = CString::fromUTF8(std::string_view(bytes).substr(0, nameStart));
    fileName = CString::fromUTF8(std::string_view(bytes).substr(nameStart));
}

P<IString> CPathes::expandEnvironment(const CStringArg& text) {
    std::string result;
    if (!expand(CString::toStdString(text), result)) throw CError("error expanding environmental string");
    return CString::fromUTF8(result);
}

P<IString> CPathes::unexpandEnvironment(const CStringArg& text) {
    std::string path = CString::toStdString(text);
    std::string result = path;
    size_t longest = 1; // a variable that holds "/" is never used
    for (const char* name : {"HOME", "XDG_DATA_HOME", "XDG_CONFIG_HOME", "TMPDIR"}) {
        const char* value = std::getenv(name);
        std::string folder = value ? value : "";
        if (folder.size() <= longest || folder[0] != '/' || !path.starts_with(folder)) continue;
        std::string rest = path.substr(folder.size());
        bool whole = rest.empty() || rest[0] == '/';
        if (!whole && !folder.ends_with('/')) continue;
        longest = folder.size();
        result = (whole ? "$" + std::string(name) : "${" + std::string(name) + "}") + rest;
    }
    std::string back;
    if (!expand(result, back) || back != path) throw CError("error unexpanding environmental string");
    return CString::fromUTF8(result);
}

} // namespace peru::posix

namespace peru {

P<IPathes> getPathes() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IPathes>(key, [] { return P<IPathes>(make<posix::CPathes>()); });
}

} // namespace peru
