// Writes a minidump for debuggers.
#pragma once

#include "crashhandler/Threads.h"

#include <csignal>

namespace crashhandler {

class CSafeWriter;

// Writes the state of the process at the crash: system, threads with registers and stacks, modules with build
// ids, the memory map and the status. For use in a signal handler with all other threads stopped. A stack
// that contains `stackLimit` is cut there: the arguments and the environment, which may contain secrets, come
// after it. The format is that of Windows minidumps with the usual Linux extensions.
void writeMiniDump(CSafeWriter& out, const siginfo_t& signal, const SThreadState* threads, size_t threadCount,
                   uintptr_t stackLimit);

} // namespace crashhandler
