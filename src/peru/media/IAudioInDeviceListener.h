// Receives the samples of an input device.
#pragma once

#include "peru/media/VolumeInfo.h"

#include <cstdint>

namespace peru::media {

// Called on the device's own thread with the lock on the list of listeners held. Must return quickly and must
// not open, start, stop or close the device or wait for a thread that does: closing waits for the callback.
// Must not throw; an exception ends the recording just like returning false.
class PERU_MEDIA_API IAudioInDeviceListener : public virtual IBase {
public:
    // `size` bytes of complete frames in the device's format, valid during the call. Returning false stops
    // the device; the remaining listeners do not get the block.
    virtual bool onAudioData(const void* data, int64_t size) = 0;
    // The level at the start of the block just passed to onAudioData.
    virtual void onVolume(const P<CVolumeInfo>& volume) = 0;
};

} // namespace peru::media
