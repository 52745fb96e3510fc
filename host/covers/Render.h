// The command render.
#pragma once

#include <filesystem>
#include <string>

namespace host::covers {

struct SRenderRequest {
    std::filesystem::path file;
    std::filesystem::path output; // its extension is one of kPictureTypes
    double dpi = 300;
    std::string target; // see findDesign()
    int item = 1;
    bool isGrey = false;
    bool hasFileNames = false; // see SConvertRequest
    bool force = false;
};

inline constexpr const char* kPictureTypes[] = {".png", ".pdf", ".svg"};

// Returns an exit code.
int renderDesign(const SRenderRequest& request);

} // namespace host::covers
