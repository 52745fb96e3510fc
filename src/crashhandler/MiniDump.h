// Writes a minidump that debuggers read.
#pragma once

#include "crashhandler/Threads.h"

#include <csignal>

namespace crashhandler {

class CSafeWriter;

// The state of the process at the crash: system, threads with registers and stacks, modules with build ids,
// the memory map and the status. Only from a signal handler, with every other thread stopped. Stacks end
// below `stackLimit` where that is inside the stack: the arguments and the environment lie behind it, and
// with them secrets. The format is the one of Windows minidumps with the Linux streams that debuggers know.
void writeMiniDump(CSafeWriter& out, const siginfo_t& signal, const SThreadState* threads, size_t threadCount,
                   uintptr_t stackLimit);

} // namespace crashhandler
