// The machine's sound devices.
#pragma once

#include "Library.h"

#include <stdexcept>
#include <string>

namespace host {

struct CNoDevice;
void printNoDevice(const CNoDevice& failure);

// There is no such device.
struct CNoDevice : std::runtime_error {
    using std::runtime_error::runtime_error;
};

// Runs a command that needs a device. With JSON, a missing one is an event, too.
template <class Command> int needingDevice(bool json, Command command) {
    try {
        return command();
    } catch (const CNoDevice& failure) {
        if (json) printNoDevice(failure);
        throw;
    }
}

// Throws CNoDevice when there is nothing to play on.
void requireOutDevice();

// The input device with that id, the default one for an empty id. Throws CNoDevice.
CHandle openInDevice(const std::string& id);

} // namespace host
