// The seven priority steps on this platform.
#pragma once

#include <sys/types.h>

namespace peru::posix {

// Sets a thread's step, or the nearest one that the system permits. Returns 0 or an errno value; a missing
// permission is not an error.
int setThreadPriority(pid_t thread, int step);

} // namespace peru::posix
