// tonewright disc --extract
#pragma once

#include "library/Library.h"

#include <filesystem>
#include <string>
#include <vector>

namespace host {

struct SExtractOptions {
    std::filesystem::path place;     // empty: the first drive with a disc
    std::vector<std::string> names;  // on the disc, with "/" between folders
    std::filesystem::path directory; // for the files
    bool force = false;
    bool json = false;
};

// Copies files, and folders with everything in them, under their own names. Returns an exit code; throws
// std::runtime_error if the disc cannot be read at all.
int extractFiles(CLibrary& library, const SExtractOptions& options);

} // namespace host
