// The sound devices of the machine.
#pragma once

#include "peru/collections/IEnum.h"
#include "peru/media/IAudioInDevice.h"
#include "peru/media/IAudioOutDevice.h"

namespace peru::media {

// Every call gives device objects of its own; a machine without devices gives empty answers. Throws
// CMediaException where the sound system cannot be reached at all. Any thread.
class PERU_MEDIA_API ISystem : public virtual IBase {
public:
    virtual WEnum<IAudioOutDevice> getOutDevices() = 0;
    virtual WEnum<IAudioInDevice> getInDevices() = 0;
    virtual P<IAudioOutDevice> getDefaultOutDevice() = 0; // empty when there is none
    virtual P<IAudioInDevice> getDefaultInDevice() = 0;
};

// Reaches for the sound system at the first call, which takes some tens of milliseconds.
PERU_MEDIA_API P<ISystem> getSystem();
// From now on getSystem() gives this one, for hosts and tests with devices of their own; empty: the machine's
// again.
PERU_MEDIA_API void setSystem(const P<ISystem>& system);

} // namespace peru::media
