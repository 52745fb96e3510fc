// Handles crashes: fatal signals and uncaught exceptions.
#pragma once

namespace crashhandler {

// Texts for the files that a crash leaves behind.
struct SNames {
    const char* application; // name and version for the report
    const char* report;      // path of the text report
    const char* dump;        // path of the minidump without its ".dmp"
};

// Installs handlers for the fatal signals and the terminate handler of the process. A crash writes both
// files, replacing existing ones, then calls the previous handlers, so that the host's own still run. A
// second call only changes the names. Must not be called by two threads at the same time.
void install(const SNames& names);

} // namespace crashhandler
