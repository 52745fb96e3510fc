// Playback.
#pragma once

#include "peru/media/IAudioDevice.h"
#include "peru/streams/IStreams.h"

namespace peru::media {

// Plays its queue, and silence while the queue is empty; it never stops by itself. write, getQueuedSize,
// getPosition and getStatus may be called while another thread calls the other operations.
class PERU_MEDIA_API IAudioOutDevice : public virtual IAudioDevice {
public:
    // Does nothing if already open. Plays from its own queue, which write() fills, or from `source` if given.
    // The source is read on the device's thread, so reading must not block; write() then throws.
    virtual void open(const P<CAudioFormat>& format, const P<IInStream>& source = nullptr) = 0;
    virtual void start() = 0; // also resumes after pause
    virtual void pause() = 0; // silence from the next buffer on; the queue is kept
    virtual void stop() = 0;  // stops at once and discards the queue; the device stays open

    // Copies the bytes to the end of the queue. Throws if the device has disappeared.
    virtual void write(const void* data, int64_t size) = 0;
    virtual int64_t getQueuedSize() const = 0; // bytes not yet passed to the sound system
    // Seconds of queued sound that have been heard since the device was opened; time spent paused or without
    // data does not count. Throws if the device has disappeared since it was started, even while paused.
    virtual double getPosition() const = 0;
};

} // namespace peru::media
