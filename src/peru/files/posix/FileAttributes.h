// What surrounds the bytes of a file: owner, rights, extended attributes.
#pragma once

namespace peru::posix {

// Gives the file `to`, which is open, the attributes of the open file `from`, as far as this user and the
// file system allow it, and never more rights than others had to the old one. Answers 0 or an errno value.
int takeOverAttributes(int from, int to);

} // namespace peru::posix
