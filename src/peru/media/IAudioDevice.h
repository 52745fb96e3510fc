// Common interface of input and output devices.
#pragma once

#include "peru/media/AudioFormat.h"
#include "peru/strings/IString.h"

namespace peru::media {

// The state of a device.
enum EDeviceStatus : int32_t {
    kDeviceIdle = 0,   // closed, opened but not started, paused, or its stream has ended
    kDeviceRunning = 1 // playing or recording
};

// A device is closed, opened or running, and may be opened again after close. Operations must not be called
// by two threads at the same time unless stated otherwise. While a device runs, the sound system's own thread
// moves the samples. All operations except the getters of names throw CMediaException.
class PERU_MEDIA_API IAudioDevice : public virtual IBase {
public:
    // The index in decimal digits. Valid for this object; after devices have been added or removed, a new
    // enumeration may assign it to another device.
    virtual P<IString> getId() const = 0;
    virtual P<IString> getName() const = 0; // the driver's name for it
    virtual P<IString>
    getListName() const = 0; // "ID: 3 - NAME (HOST API)", with " [DEFAULT]" for the default
    virtual P<IString> getHostApi() const = 0;
    virtual bool isDefault() const = 0;
    virtual int32_t getMaxChannelCount() const = 0;
    // The format to open the device with: the requested one if the device supports it, otherwise the nearest
    // supported one (rate first, then channels); empty if there is none. A sample width that this library
    // does not support is returned unchanged; open() then throws.
    virtual P<CAudioFormat> getFormat(int32_t sampleRate, int32_t bytesPerSample, int32_t channelCount) = 0;

    virtual bool isOpened() const = 0;
    virtual int32_t getStatus() const = 0; // an EDeviceStatus; thread-safe
    // Closes the device at once, in any state; queued samples are discarded.
    virtual void close() = 0;

    // Factor applied to every sample, initially 1.0, which leaves the samples unchanged. Thread-safe.
    virtual double getGain() const = 0;
    virtual void setGain(double gain) = 0;

    // The sound system as its users know it, such as "ALSA"; getHostApi() has no names for the systems of
    // Linux.
    virtual P<IString> getHostApiDisplayName() const { return getHostApi(); }
};

} // namespace peru::media
