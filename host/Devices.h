// The machine's sound devices.
#pragma once

#include "Library.h"

#include <stdexcept>
#include <string>

namespace host {

// There is no such device.
struct CNoDevice : std::runtime_error {
    using std::runtime_error::runtime_error;
};

// Throws CNoDevice when there is nothing to play on.
void requireOutDevice();

// The input device with that id, the default one for an empty id. Throws CNoDevice.
CHandle openInDevice(const std::string& id);

} // namespace host
