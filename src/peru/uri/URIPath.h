// URI paths split into segments. They are escaped: a segment contains no "/".
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace peru::uri {

// The segments of a path, and whether it names a directory.
struct SPath {
    std::vector<std::string> segments;
    bool absolute = false;
    bool directory = false;

    // Number of segments of the directory that the path names or lies in.
    size_t getDirectoryDepth() const {
        return directory || segments.empty() ? segments.size() : segments.size() - 1;
    }
};

SPath splitPath(std::string_view text);
std::string joinPath(const SPath& path);
// Removes "." and "..". Above the root of an absolute path ".." is dropped, in a relative path it is kept.
void normalize(SPath& path);
std::string normalizePath(std::string_view text);

} // namespace peru::uri
