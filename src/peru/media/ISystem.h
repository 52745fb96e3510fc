// The sound devices of the machine.
#pragma once

#include "peru/collections/IEnum.h"
#include "peru/media/IAudioInDevice.h"
#include "peru/media/IAudioOutDevice.h"

namespace peru::media {

// Every call returns new device objects for the devices that exist now; on a machine without devices the
// results are empty. While any device is open, added devices and a new default are not seen, since the sound
// system must be restarted for that. Existing objects remain valid: if their device has disappeared, opening
// it throws. Calls take some tens of milliseconds. Throws CMediaException if the sound system cannot be
// reached at all. Thread-safe.
class PERU_MEDIA_API ISystem : public virtual IBase {
public:
    virtual WEnum<IAudioOutDevice> getOutDevices() = 0;
    virtual WEnum<IAudioInDevice> getInDevices() = 0;
    virtual P<IAudioOutDevice> getDefaultOutDevice() = 0; // empty if there is none
    virtual P<IAudioInDevice> getDefaultInDevice() = 0;
};

// The first call connects to the sound system, which takes some tens of milliseconds.
PERU_MEDIA_API P<ISystem> getSystem();
// Makes getSystem() return this object, for hosts and tests with devices of their own; an empty handle
// restores the machine's.
PERU_MEDIA_API void setSystem(const P<ISystem>& system);

} // namespace peru::media
