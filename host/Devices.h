// The machine's sound devices.
#pragma once

#include "Library.h"
#include "peru/IInstanceWrapper.h"
#include "peru/media/IAudioInDevice.h"

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
peru::P<peru::media::IAudioInDevice> findInDevice(const std::string& id);

// A handle of a device for the library, for one call.
class CDeviceHandle {
public:
    explicit CDeviceHandle(const peru::P<peru::media::IAudioInDevice>& device) : m_wrapper(device) {}
    TONEWRIGHT_Handle get() {
        return reinterpret_cast<TONEWRIGHT_Handle>(static_cast<peru::IInstanceWrapper*>(&m_wrapper));
    }

private:
    peru::CInstanceWrapper m_wrapper;
};

} // namespace host
