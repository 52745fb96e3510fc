// The kinds of drives.
#pragma once

#include "Medium.h"

#include <memory>
#include <string>
#include <vector>

namespace discio {

using Drives = std::vector<std::shared_ptr<IDrive>>;

// Optical drives, as udev knows them; none of them is opened.
Drives findDeviceDrives();
// The folders in TONEWRIGHT_DRIVE_FOLDERS.
Drives findFolderDrives();
// A drive that always contains this image.
std::shared_ptr<IDrive> createImageDrive(const std::string& path);

} // namespace discio
