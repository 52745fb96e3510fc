// Handles Ctrl-C.
#pragma once

namespace host {

// From now on SIGINT, SIGTERM and SIGHUP request a clean end; a second one ends the program at once. SIGPIPE
// and SIGXFSZ are ignored: a closed pipe or a file size limit does not end the program.
void watchForCancel();
// Any thread.
bool isCancelled();
// Sets a function that the signal handler calls; null for none.
void onCancel(void (*react)());

} // namespace host
