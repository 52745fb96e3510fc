// Who hears an input device.
#pragma once

#include "peru/media/VolumeInfo.h"

#include <cstdint>

namespace peru::media {

// Both operations are called on the device's own thread, must be quick, and must neither open nor close the
// device. They may not throw; an exception ends the recording as a false answer does.
class PERU_MEDIA_API IAudioInDeviceListener : public virtual IBase {
public:
    // `size` bytes of whole frames in the device's format, valid during the call. False stops the device; the
    // listeners behind this one do not get the block.
    virtual bool onAudioData(const void* data, int64_t size) = 0;
    // The level at the start of the block that was just told.
    virtual void onVolume(const P<CVolumeInfo>& volume) = 0;
};

} // namespace peru::media
