// The command info.
#pragma once

#include <filesystem>
#include <vector>

namespace host::covers {

struct SInfoOptions {
    std::vector<std::filesystem::path> files;
    bool isJson = false;
};

// Returns an exit code. A file that fails does not stop the others.
int showInfo(const SInfoOptions& options);

} // namespace host::covers
