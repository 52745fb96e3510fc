// Runs an operation whose system calls on files fail at will.
#pragma once

#include <functional>
#include <string>

namespace tests {

struct SFault {
    int call = 0;         // the first file call that is struck, counted from 1; 0 for none
    int error = 0;        // what it fails with, an errno value; 0 kills the process in its place
    bool forGood = false; // all that follow fail too
};

struct SFaultyRun {
    bool supported = true; // clear where the kernel does not let a process watch another's calls
    bool struck = false;   // the run came as far as the fault
    bool renaming = false; // the call that was struck first is one that renames
    int status = 0;        // as waitpid tells it
    std::string report;    // what the operation returned; empty when it did not come to its end
};

// In a child process. The calls are caught at the kernel's door, whichever library makes them: opening,
// reading, writing, copying, syncing, naming, cutting files and changing their owner and mode. Closing and
// removing always work, as they do on a disk that is full or broken. `prepare` runs before calls are counted.
SFaultyRun runWithFault(const SFault& fault, const std::function<std::function<std::string()>()>& prepare);

} // namespace tests
