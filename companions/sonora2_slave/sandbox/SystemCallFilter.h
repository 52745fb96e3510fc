// The system calls that a process may make, enforced by seccomp.
#pragma once

namespace slave {

// Refuses, for all threads and for good, what neither codecs nor this system need: EPERM, so that a library
// that only tries continues without. `makesFiles` permits changing the attributes of open files, which an
// encoder that replaces a file does. Needs no_new_privs. False if the kernel has no filters; throws
// std::system_error on other failures.
bool filterSystemCalls(bool makesFiles);

} // namespace slave
