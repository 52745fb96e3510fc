#include "peru/uri/URIPath.h"

namespace peru::uri {

void normalize(SPath& path) {
    std::vector<std::string> kept;
    for (size_t i = 0; i < path.segments.size(); ++i) {
        std::string& segment = path.segments[i];
        const bool last = i + 1 == path.segments.size();
        if (segment == ".") {
            if (last) path.directory = true;
        } else if (segment == "..") {
            if (!kept.empty() && kept.back() != "..")
                kept.pop_back();
            else if (!path.absolute)
                kept.push_back("..");
            if (last) path.directory = true;
        } else {
            kept.push_back(std::move(segment));
        }
    }
    path.segments = std::move(kept);
}

SPath splitPath(std::string_view text) {
    SPath path;
    path.absolute = text.starts_with('/');
    if (path.absolute) text.remove_prefix(1);
    if (text.empty()) {
        path.directory = true;
        return path;
    }
    path.directory = text.ends_with('/');
    if (path.directory) text.remove_suffix(1);
    for (size_t start = 0;;) {
        const size_t end = text.find('/', start);
        path.segments.emplace_back(text.substr(start, end - start));
        if (end == std::string_view::npos) return path;
        start = end + 1;
    }
}

std::string joinPath(const SPath& path) {
    std::string text;
    if (path.absolute)
        text = '/';
    else if (!path.segments.empty() && path.segments[0].empty())
        text = "./"; // otherwise the empty first segment would make the path absolute
    for (size_t i = 0; i < path.segments.size(); ++i) {
        text += path.segments[i];
        if (i + 1 < path.segments.size() || path.directory) text += '/';
    }
    return text;
}

std::string normalizePath(std::string_view text) {
    if (text.empty()) return {};
    SPath path = splitPath(text);
    normalize(path);
    return joinPath(path);
}

} // namespace peru::uri
