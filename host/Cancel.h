// Ctrl-C.
#pragma once

namespace host {

// From now on SIGINT, SIGTERM and SIGHUP ask for a clean end; a second one ends the program at once. A reader
// of the output that leaves, or a limit of file sizes, ends nothing.
void watchForCancel();
// Any thread.
bool isCancelled();
// Called in the signal's handler when that happens; null: nothing is.
void onCancel(void (*react)());

} // namespace host
