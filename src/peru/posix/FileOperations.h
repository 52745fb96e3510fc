// The calls behind copying and moving. Each returns 0 or an errno value and leaves nothing half done.
#pragma once

#include <string>

namespace peru::posix {

// Copies the bytes, mode and times of a regular file; EEXIST when anything stands at the destination.
int copyRegularFile(const std::string& source, const std::string& destination);
// EEXIST when anything stands at the destination, EXDEV between volumes.
int renameWithoutReplacing(const std::string& source, const std::string& destination);

} // namespace peru::posix
