// The command convert.
#pragma once

#include <filesystem>

namespace host::covers {

struct SConvertRequest {
    std::filesystem::path file;
    std::filesystem::path output; // its extension is one of kProjectTypes
    bool isLossless = false;
    // Exported projects: pictures are read from the files that they name, and not stored if those exist.
    bool hasFileNames = false;
    bool force = false;
};

inline constexpr const char* kProjectTypes[] = {".cedprj", ".xml"};

// Returns an exit code.
int convertProject(const SConvertRequest& request);

} // namespace host::covers
