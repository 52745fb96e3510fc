// Recording.
#pragma once

#include "peru/media/IAudioDevice.h"
#include "peru/media/IAudioInDeviceListener.h"

namespace peru::media {

class PERU_MEDIA_API IAudioInDevice : public virtual IAudioDevice {
public:
    // The format used by open() if it gets none.
    virtual void setFormat(const P<CAudioFormat>& format) = 0;
    virtual void open(const P<CAudioFormat>& format = nullptr) = 0; // does nothing if already open
    virtual void start() = 0;
    virtual void stop() = 0; // stops and closes the stream

    // Seconds since start. Thread-safe.
    virtual double getPosition() const = 0;

    // Listeners are not owned and must be removed before they are destroyed. removeListener waits for calls
    // in progress, so it must not be called with a lock held that a listener takes. Both may be called from
    // any thread except the device's own, that is, not by a listener during its call.
    virtual void addListener(IAudioInDeviceListener* listener) = 0;
    virtual void removeListener(IAudioInDeviceListener* listener) = 0;
};

} // namespace peru::media
