// Playback.
#pragma once

#include "peru/media/IAudioDevice.h"
#include "peru/streams/IStreams.h"

namespace peru::media {

// Plays what lies in its queue and silence where nothing does; it never ends by itself. write, getQueuedSize,
// getPosition and getStatus may be called while another thread calls the rest.
class PERU_MEDIA_API IAudioOutDevice : public virtual IAudioDevice {
public:
    // Does nothing when opened. Plays from a queue of its own that write() fills, or, with a source, from
    // that: it is read on the device's thread, so reading must not wait, and write() throws.
    virtual void open(const P<CAudioFormat>& format, const P<IInStream>& source = nullptr) = 0;
    virtual void start() = 0; // also goes on after pause
    virtual void pause() = 0; // silence from the next buffer on; nothing that is queued is lost
    virtual void stop() = 0;  // at once, dropping what is queued; the device stays opened

    // Copies the bytes to the end of the queue. Throws when the device has gone.
    virtual void write(const void* data, int64_t size) = 0;
    virtual int64_t getQueuedSize() const = 0; // bytes that have not been handed to the system yet
    // Seconds of the queue's sound that have been heard since the device was opened: time spent in pauses
    // or without data does not count. Throws when the device has gone since it was started, paused or not.
    virtual double getPosition() const = 0;
};

} // namespace peru::media
