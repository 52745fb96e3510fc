// Handles crashes: fatal signals and uncaught exceptions.
#pragma once

namespace crashhandler {

// Texts for the files that a crash leaves behind.
struct SNames {
    const char* application; // name and version for the report
    const char* report;      // path of the text report
    const char* dump;        // path of the minidump without its ".dmp"; null for none
    // An open file that takes the report instead of the path, for a process that may not open files.
    int reportFile = -1;
    // Further lines of the report, read at the time of the crash; null for none. The text may change at any
    // time as long as it stays terminated.
    const char* details = nullptr;
    bool modules = true; // list the modules of the process in the report
};

// Installs handlers for the fatal signals and the terminate handler of the process. A crash writes both
// files, replacing existing ones, then calls the previous handlers, so that the host's own still run. All
// other threads stop while the files are written and continue afterwards; a process that cannot write them
// within half a minute ends. Only the first crash is reported. A second call only changes the names. Must not
// be called by two threads at the same time.
void install(const SNames& names);

// Lets the handler run after a stack overflow of the calling thread; does nothing before install(). install()
// does this for its own thread, and all threads that the library creates have such a stack. A host's thread
// whose stack overflows leaves no files unless it has called this: the signal has no stack to run on. Cheap
// after the first call of a thread.
void useAlternateStack();

} // namespace crashhandler
