// The files that a command's arguments stand for.
#pragma once

#include "library/Library.h"

#include <filesystem>
#include <set>
#include <string>
#include <vector>

namespace host {

struct SInputFile {
    std::filesystem::path file;
    std::filesystem::path below; // its folder, relative to the folder that was named; empty for a named file
    std::string problem;         // why it cannot be used; normally empty
};

// The extensions of what the library reads, in lower case without points.
std::set<std::string> listReadExtensions(CLibrary& library);

// Named files come first to last as they are. With `recursive`, folders are replaced by the files in and
// below them that the library reads, judged by their extensions and in the order of their names; without it,
// and if there are no such files, a folder has a problem. Hidden files, and whatever is in `excluded`, are
// left out. Symbolic links are followed, but no folder is visited twice.
std::vector<SInputFile> listInputs(CLibrary& library, const std::vector<std::filesystem::path>& inputs,
                                   bool recursive, const std::filesystem::path& excluded);

} // namespace host
