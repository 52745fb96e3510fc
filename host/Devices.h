// The machine's sound devices.
#pragma once

#include "Library.h"

#include <stdexcept>
#include <string>

namespace host {

struct CNoDevice;
void printNoDevice(const CNoDevice& failure);

// The device does not exist.
struct CNoDevice : std::runtime_error {
    using std::runtime_error::runtime_error;
};

// Runs a command that needs a device. With `json`, a missing device is also reported as an event.
template <class Command> int needingDevice(bool json, Command command) {
    try {
        return command();
    } catch (const CNoDevice& failure) {
        if (json) printNoDevice(failure);
        throw;
    }
}

// Throws CNoDevice if there is no output device.
void requireOutDevice();

// Opens the input device with that id, or the default one if the id is empty. Throws CNoDevice.
CHandle openInDevice(const std::string& id);

} // namespace host
