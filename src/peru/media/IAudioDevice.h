// What input and output devices have in common.
#pragma once

#include "peru/media/AudioFormat.h"

namespace peru::media {

// The state word of a device.
enum EDeviceStatus : int32_t {
    kDeviceIdle = 0,   // closed, opened and not started, paused, or its stream has ended
    kDeviceRunning = 1 // sound flows
};

// Closed, opened, running; usable again after close. Operations are called by one thread at a time unless
// told otherwise; while a device runs its sound is moved by a thread of its own. All but the getters of names
// throw CMediaException.
class PERU_MEDIA_API IAudioDevice : public virtual IBase {
public:
    virtual P<IString> getId() const = 0;   // the index in decimal digits, stable while the process runs
    virtual P<IString> getName() const = 0; // the name the system's driver gives
    virtual P<IString>
    getListName() const = 0; // "ID: 3 - NAME (HOST API)", with " [DEFAULT]" for the default
    virtual P<IString> getHostApi() const = 0;
    virtual bool isDefault() const = 0;
    virtual int32_t getMaxChannelCount() const = 0;
    // The format to open the device with: the wanted one where the device takes it, else the nearest it
    // takes (rate first, then channels); empty when there is none. A width that no device of this library
    // takes is returned as wanted: opening says so.
    virtual P<CAudioFormat> getFormat(int32_t sampleRate, int32_t bytesPerSample, int32_t channelCount) = 0;

    virtual bool isOpened() const = 0;
    virtual int32_t getStatus() const = 0; // an EDeviceStatus; any thread
    // From any state back to closed, at once: what is queued is dropped.
    virtual void close() = 0;

    // Factor on every sample, 1.0 at first, which leaves the samples untouched. Any thread.
    virtual double getGain() const = 0;
    virtual void setGain(double gain) = 0;
};

} // namespace peru::media
