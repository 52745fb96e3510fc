// tonewright tag cover
#pragma once

#include <filesystem>
#include <optional>
#include <vector>

namespace host {

struct SCoverOptions {
    std::vector<std::filesystem::path> files;
    std::filesystem::path picture; // to import or to write
    std::optional<int> type;
    bool force = false;
    bool json = false;
};

// Each returns an exit code.
int showCovers(const SCoverOptions& options);
int exportCover(const SCoverOptions& options);
int importCover(const SCoverOptions& options);
int removeCovers(const SCoverOptions& options);

} // namespace host
