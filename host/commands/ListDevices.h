// tonewright devices
#pragma once

namespace host {

// Returns an exit code.
int listDevices(bool json);

// Prints the devices, and then every change until the user stops it or nobody reads the output any more.
// Returns an exit code.
int watchDevices(bool json);

} // namespace host
