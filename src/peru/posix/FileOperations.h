// The calls behind copying and moving. Each returns 0 or an errno value and leaves nothing half done.
#pragma once

#include "peru/posix/PlatformFile.h"

#include <cstddef>
#include <string>

namespace peru::posix {

// Copies the bytes, mode and times of a regular file; EEXIST when anything stands at the destination.
int copyRegularFile(const std::string& source, const std::string& destination);
// EEXIST when anything stands at the destination, EXDEV between volumes.
int renameWithoutReplacing(const std::string& source, const std::string& destination);
// Writes the bytes to the new file `beside`, which is open as `file`, and gives it the name of `target`. What
// stood there hands on its mode, and stays when anything fails; `beside` is gone then.
int fillAndReplace(CFileHandle file, const std::string& beside, const std::string& target, const void* data,
                   size_t size);

} // namespace peru::posix
