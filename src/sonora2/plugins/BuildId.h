// Identity of a library file.
#pragma once

#include "sonora2/Api.h"

#include <string>

namespace sonora2::common {

// The identifier that the linker derived from the library's content, in hexadecimal digits; it survives
// stripping. Empty if the file has none or cannot be read.
SONORA2_API std::string getBuildId(const std::string& file);

} // namespace sonora2::common
