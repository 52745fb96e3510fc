// Parser for the kernel's list of mounts.
#pragma once

#include "peru/Api.h"

#include <string>
#include <string_view>
#include <vector>

namespace peru {

// One line of the list. Paths are bytes.
struct SMount {
    std::string device; // "major:minor"
    std::string root;   // the mounted folder of the file system; "/" unless only a part is mounted
    std::string mountPoint;
    std::string fileSystem; // such as "ext4"
    std::string source;     // such as "/dev/sda1"
    bool readOnly = false;
};

// Skips malformed lines.
PERU_API std::vector<SMount> parseMountTable(std::string_view text);

// Selects the mounts that a user regards as volumes, each device once. Leaves out the kernel's virtual file
// systems and mounts that are hidden by a later mount.
PERU_API std::vector<SMount> selectVolumes(const std::vector<SMount>& mounts);

} // namespace peru
