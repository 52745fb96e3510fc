// The text in which the kernel lists what is mounted.
#pragma once

#include "peru/Api.h"

#include <string>
#include <string_view>
#include <vector>

namespace peru {

// One line of it. Paths are bytes.
struct SMount {
    std::string device; // "major:minor"
    std::string root;   // the folder of the file system that is seen; "/" unless a part is mounted
    std::string mountPoint;
    std::string fileSystem; // such as "ext4"
    std::string source;     // such as "/dev/sda1"
    bool readOnly = false;
};

// Lines that are none are passed over.
PERU_API std::vector<SMount> parseMountTable(std::string_view text);

// Of the mounts those that a user knows as volumes, each device once: file systems of the kernel's making
// and single files are left out, and a mount that another one covers.
PERU_API std::vector<SMount> selectVolumes(const std::vector<SMount>& mounts);

} // namespace peru
