// The files that go onto a data disc.
#pragma once

#include "media/DiscProject.h"

#include <filesystem>
#include <vector>

namespace host {

struct SDiscFile {
    CDiscProject::Path path;      // on the disc
    std::filesystem::path source; // empty for a folder
};

// Files, and folders with everything in and below them, hidden files as well, under their own names. Folders
// come before their content, entries in the order of their names. Symbolic links are followed; a folder that
// contains itself through one is a failure. `excluded` is left out. Throws std::runtime_error for whatever
// cannot be read, and for what is neither a file nor a folder.
std::vector<SDiscFile> listDiscFiles(const std::vector<std::filesystem::path>& inputs,
                                     const std::filesystem::path& excluded);

} // namespace host
