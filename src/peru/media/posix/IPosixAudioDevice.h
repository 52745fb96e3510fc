// A device of the engine.
#pragma once

#include "peru/media/IAudioDevice.h"

namespace peru::media::posix {

class IPosixAudioDevice : public virtual IAudioDevice {
public:
    virtual int32_t getDeviceIndex() const = 0; // the engine's
};

} // namespace peru::media::posix
