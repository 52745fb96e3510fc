// The seven priority steps on this platform.
#pragma once

#include <sys/types.h>

namespace peru::posix {

// Gives one thread the step, or the nearest that the system allows. Answers 0 or an errno value; a missing
// permission is none.
int setThreadPriority(pid_t thread, int step);

} // namespace peru::posix
