// Recording.
#pragma once

#include "peru/media/IAudioDevice.h"
#include "peru/media/IAudioInDeviceListener.h"

namespace peru::media {

class PERU_MEDIA_API IAudioInDevice : public virtual IAudioDevice {
public:
    // The format that open uses when it is given none.
    virtual void setFormat(const P<CAudioFormat>& format) = 0;
    virtual void open(const P<CAudioFormat>& format = nullptr) = 0; // does nothing when opened
    virtual void start() = 0;
    virtual void stop() = 0; // ends and closes the stream

    // Seconds since start. Any thread.
    virtual double getPosition() const = 0;

    // Held without a reference: a listener removes itself before it dies. Once remove has returned no call
    // to that listener is under way. Any thread but the device's own.
    virtual void addListener(IAudioInDeviceListener* listener) = 0;
    virtual void removeListener(IAudioInDeviceListener* listener) = 0;
};

} // namespace peru::media
