// What a slave may touch for the one medium that it was started for.
#pragma once

#include "sonora2_slave/sandbox/Sandbox.h"

namespace slave {

// The medium, and the files beside it that its format consists of.
SSandbox allowReading(const std::filesystem::path& medium);

// The folder of the target, at the end of links: the target may be created, or be replaced by a file that is
// written beside it. Of a device or a pipe, only itself.
SSandbox allowWriting(const std::filesystem::path& target);

} // namespace slave
