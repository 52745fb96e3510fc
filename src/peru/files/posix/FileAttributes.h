// A file's metadata: owner, permissions, extended attributes.
#pragma once

namespace peru::posix {

// Copies the attributes of the open file `from` to the open file `to` as far as the user and the file system
// permit, and never grants anyone more access than the old file did. Returns 0 or an errno value.
int takeOverAttributes(int from, int to);

} // namespace peru::posix
