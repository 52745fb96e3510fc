// tonewright tag from-name and rename
#pragma once

#include "library/Library.h"
#include "media/NamePattern.h"

#include <filesystem>
#include <optional>
#include <vector>

namespace host {

struct STagNameOptions {
    std::vector<std::filesystem::path> files;
    std::optional<CNamePattern> pattern;
    std::filesystem::path directory; // for new names; empty for each file's own folder
    bool dryRun = false;
    bool json = false;
};

// Each returns an exit code.
int setTagsFromNames(CLibrary& library, const STagNameOptions& options);
int renameByTags(CLibrary& library, const STagNameOptions& options);

} // namespace host
