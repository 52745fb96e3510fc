// Catches what nobody else catches: fatal signals and exceptions that leave a thread.
#pragma once

namespace crashhandler {

// What a crash leaves behind, in three texts.
struct SNames {
    const char* application; // name and version, as the report states them
    const char* report;      // path of the text report
    const char* dump;        // path of the minidump without its ".dmp"
};

// Takes over the fatal signals and the terminate handler of the process. A crash writes both files (existing
// ones are replaced), then goes on to the handlers that stood before, so that the host's own still run. A
// second call only changes the names. Not to be called from two threads at once.
void install(const SNames& names);

} // namespace crashhandler
