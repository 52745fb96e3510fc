// System calls for copying and moving. Each returns 0 or an errno value and leaves nothing incomplete.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

namespace peru::posix {

// Copies the bytes, mode and times of a regular file; EEXIST if the destination exists.
int copyRegularFile(const std::string& source, const std::string& destination);
// EEXIST if the destination exists, EXDEV between volumes.
int renameWithoutReplacing(const std::string& source, const std::string& destination);
// Copies `size` bytes from one offset to another, inside the kernel where possible. `copied` is less than
// `size` if the source is shorter.
int copyRange(int source, int64_t sourceOffset, int destination, int64_t offset, int64_t size,
              int64_t& copied);
// Calls `create` with random names in the folder until it returns something other than EEXIST. Returns the
// path, or an empty one and sets `error` to the errno value.
std::string createUnique(const std::string& folder, const std::string& prefix, const std::string& suffix,
                         int& error, const std::function<int(const std::string&)>& create);

} // namespace peru::posix
