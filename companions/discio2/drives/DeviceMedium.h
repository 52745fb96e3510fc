// The medium in an optical drive.
#pragma once

#include "Medium.h"

namespace discio {

// Reads the table of contents. Throws CDiscError.
std::shared_ptr<IMedium> openDeviceMedium(const std::string& path);

} // namespace discio
