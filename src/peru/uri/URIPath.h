// Paths of URIs, taken apart. They are escaped: a segment holds no "/".
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace peru::uri {

// The names on the way, and whether the last one is a directory's.
struct SPath {
    std::vector<std::string> segments;
    bool absolute = false;
    bool directory = false;

    // The segments of the directory that the path lies in, or that it names.
    size_t getDirectoryDepth() const {
        return directory || segments.empty() ? segments.size() : segments.size() - 1;
    }
};

SPath splitPath(std::string_view text);
std::string joinPath(const SPath& path);
// Removes "." and ".."; above the root of an absolute path ".." is dropped, in a relative one it stays.
void normalize(SPath& path);
std::string normalizePath(std::string_view text);

} // namespace peru::uri
