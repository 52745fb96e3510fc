// The machine's sound devices.
#pragma once

#include "library/Library.h"

#include <stdexcept>
#include <string>
#include <vector>

namespace host {

struct SDevice {
    std::string id;
    std::string name;
    std::string api; // the sound system behind it, such as ALSA
    int32_t channels = 0;
    bool isDefault = false;
};

// The device does not exist, or the sound system cannot be reached.
struct CNoDevice : std::runtime_error {
    using std::runtime_error::runtime_error;
};

// The present devices of a direction, TONEWRIGHT_DEVICE_INPUT or _OUTPUT. Throws CNoDevice.
std::vector<SDevice> readDevices(int32_t direction);

// Reports the missing device as an event.
void printNoDevice(const CNoDevice& failure);

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

// The output device with that id or name. Throws CNoDevice.
SDevice findOutDevice(const std::string& idOrName);
// The default output device. Throws CNoDevice.
SDevice findDefaultOutDevice();

// Opens the input device with that id, or the default one if the id is empty. Throws CNoDevice.
CHandle openInDevice(const std::string& id);

} // namespace host
