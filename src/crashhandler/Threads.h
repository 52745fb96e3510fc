// The threads of a crashing process and their registers.
#pragma once

#include <cstddef>
#include <cstdint>
#include <sys/types.h>
#include <ucontext.h>

namespace crashhandler {

struct SThreadState {
    pid_t id = 0;
    bool hasContext = false;
    ucontext_t context = {};
};

// Stops all other threads of the process in a signal handler and records their registers. Returns the number
// of entries; the crashing thread comes first. To be called once.
size_t captureThreads(const ucontext_t& crashed, SThreadState* threads, size_t capacity);
// Lets them continue, for a host that recovers from the crash.
void releaseThreads();

} // namespace crashhandler
