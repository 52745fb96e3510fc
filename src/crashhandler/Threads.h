// The threads of a crashing process and what each was doing.
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

// Stops every other thread of the process in a signal handler and notes its registers. They stay stopped:
// the process is about to end. Returns how many entries were filled, the crashing thread first.
size_t captureThreads(const ucontext_t& crashed, SThreadState* threads, size_t capacity);

} // namespace crashhandler
