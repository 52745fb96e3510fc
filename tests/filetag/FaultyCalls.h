// Runs an operation and makes selected system calls of it fail.
#pragma once

#include <functional>
#include <string>

namespace tests {

enum class ECalls {
    files, // opening, reading, writing, copying, syncing, renaming and truncating files, changing their owner
           // and mode
    network, // opening files, reading and writing; sockets, their options, connecting, sending, receiving,
             // waiting
};

struct SFault {
    int call = 0;         // the first of these calls that fails, counted from 1; 0 for none
    int error = 0;        // the errno it fails with; 0 kills the process instead
    bool forGood = false; // all later calls fail as well
    ECalls calls = ECalls::files;
};

struct SFaultyRun {
    bool supported = true; // false if the kernel does not let a process intercept another's calls
    bool struck = false;   // the run reached the fault
    bool renaming = false; // the first failed call is a rename
    int status = 0;        // from waitpid
    std::string report;    // what the operation returned; empty if it did not finish
};

// Runs the operation in a child process. Calls are intercepted in the kernel, whichever library makes them.
// Closing and removing always work, as they do on a full or broken disk. `prepare` runs before the counting
// starts.
SFaultyRun runWithFault(const SFault& fault, const std::function<std::function<std::string()>()>& prepare);

} // namespace tests
