// Changes the properties that Linux has for each thread instead of each process.
#pragma once

namespace slave {

// Calls `call(argument)` on all threads of the process, the calling one last. It runs in a signal handler on
// the others, may only make system calls, and returns 0 or an errno value. Threads that are created meanwhile
// are included. Throws std::system_error if a call fails, and if a thread does not respond within some
// seconds because it blocks all signals. One call at a time.
void runOnEveryThread(int (*call)(int argument), int argument);

} // namespace slave
