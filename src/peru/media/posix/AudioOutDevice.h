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
    void gatherCushion() const; // waits a little for it
    int64_t readSource(uint8_t* output, int64_t size);
    double getHearingTime(const PaStreamCallbackTimeInfo& time) const;
    void requireAlive() const;

    void abort(); // with the stream's mutex held: drops what is queued and what the system has

    // There is something to play, or there was since open or start. The callback waits for it for a while.
    const P<ISignal> m_signal;
    double m_framesPerMillisecond = 0.0;
    double m_latency = 0.0; // seconds between a callback and its sound, where the system does not tell
    // A stream of the caller's in the place of the queue; read by the callback alone.
    P<IInStream> m_source;

    const P<IMutex> m_queueMutex; // guards the rest; held for a copy at most
    P<IMemoryManager> m_memory;
    P<CBufferedIOStream> m_queue; // empty handle while closed
    mutable CPlayClock m_clock;
};

} // namespace peru::media::posix
