// The calls behind copying and moving. Each returns 0 or an errno value and leaves nothing half done.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

namespace peru::posix {

// Copies the bytes, mode and times of a regular file; EEXIST when anything stands at the destination.
int copyRegularFile(const std::string& source, const std::string& destination);
// EEXIST when anything stands at the destination, EXDEV between volumes.
int renameWithoutReplacing(const std::string& source, const std::string& destination);
// Copies `size` bytes from one offset to another, inside the system where that is possible. `copied` is less
// where the source ends.
int copyRange(int source, int64_t sourceOffset, int destination, int64_t offset, int64_t size,
              int64_t& copied);
// Calls `create` with one unused name in the folder after the other until it does not answer EEXIST. Returns
// the path, or an empty one with the errno value.
std::string createUnique(const std::string& folder, const std::string& prefix, const std::string& suffix,
                         int& error, const std::function<int(const std::string&)>& create);

} // namespace peru::posix
