// The command images.
#pragma once

#include <filesystem>

namespace host::covers {

struct SImagesRequest {
    std::filesystem::path file;
    std::filesystem::path folder;
    bool force = false;
};

// Returns an exit code. Nothing is written if one of the files exists and must not be replaced.
int writeImages(const SImagesRequest& request);

} // namespace host::covers
