// tonewright devices
#pragma once

namespace host {

// Returns an exit code.
int listDevices(bool json);

} // namespace host
