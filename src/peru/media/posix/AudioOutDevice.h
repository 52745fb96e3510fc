// Playback through the engine.
#pragma once

#include "peru/media/IAudioOutDevice.h"
#include "peru/media/PlayClock.h"
#include "peru/media/posix/AudioDevice.h"
#include "peru/streams/BufferedIOStream.h"
#include "peru/threads/ISignal.h"

namespace peru::media::posix {

class CAudioOutDevice : public CAudioDevice, public virtual IAudioOutDevice {
public:
    CAudioOutDevice(const P<IPosixSystem>& system, int32_t index); // throws CMediaException
    ~CAudioOutDevice() override;

    void open(const P<CAudioFormat>& format, const P<IInStream>& source = nullptr) override;
    void start() override;
    void pause() override;
    void stop() override;
    void close() override;

    void write(const void* data, int64_t size) override;
    int64_t getQueuedSize() const override;
    double getPosition() const override;

private:
    static int onOutput(const void* input, void* output, unsigned long frames,
                        const PaStreamCallbackTimeInfo* time, PaStreamCallbackFlags flags, void* self);
    void fill(uint8_t* output, int64_t frames, const PaStreamCallbackTimeInfo& time);
    void gatherCushion() const; // waits briefly for enough queued sound
    int64_t readSource(uint8_t* output, int64_t size);
    double getHearingTime(const PaStreamCallbackTimeInfo& time) const;
    void requireAlive() const;

    void abort(); // requires the stream's mutex; discards the queue and the system's buffer

    // Set once there has been something to play since open or start. The callback waits for it for a while.
    const P<ISignal> m_signal;
    double m_framesPerMillisecond = 0.0;
    double m_latency = 0.0; // seconds from a callback to its sound, if the system does not report it
    // The caller's stream in place of the queue; only read by the callback.
    P<IInStream> m_source;

    const P<IMutex> m_queueMutex; // guards the members below; never held longer than a copy takes
    P<IMemoryManager> m_memory;
    P<CBufferedIOStream> m_queue; // empty handle while closed
    mutable CPlayClock m_clock;
};

} // namespace peru::media::posix
