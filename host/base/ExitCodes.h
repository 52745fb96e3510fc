// Exit codes of the program.
#pragma once

namespace host {

enum EExitCode {
    kExitSuccess = 0,
    kExitFailure = 1, // at least one file failed
    kExitUsage = 2,
    kExitNoDevice = 3,  // no sound device, or not the requested one
    kExitNoLibrary = 4, // the library is missing or cannot be started
    kExitCancelled = 130,
};

} // namespace host
