// Plays sources on an output device.
#pragma once

#include "peru/Object.h"
#include "peru/media/IAudioOutDevice.h"
#include "peru/threads/IMutex.h"
#include "peru/threads/ISignal.h"
#include "peru/uri/IURI.h"
#include "sonora2/plugins/IPluginHandler.h"
#include "tonewright/CallbackSlot.h"
#include "tonewright/ICallbackTargets.h"
#include "tonewright/tonewright.h"

#include <atomic>
#include <deque>
#include <optional>

namespace tonewright {

// Has no thread of its own: play() feeds the device on the caller's thread; everything else is called from
// other threads, at any time. Callbacks must not call play() and stop(). Callers must keep the player alive
// during a call.
class CPlayer : public peru::CObject, public IPlayerProgressTarget, public IPlayerControl {
public:
    static constexpr uint32_t kStopMilliseconds = 10000;

    // Both throw CError if there is no suitable device, format or source. The first asks the handler for a
    // source in a format that the device supports; the second never converts, so the device must support the
    // source's own format.
    CPlayer(const P<peru::IURI>& uri, const P<sonora2::common::IPluginHandler>& handler);
    explicit CPlayer(const P<sonora2::common::IAudioSource>& source,
                     uint32_t stopMilliseconds = kStopMilliseconds);
    ~CPlayer() override; // never throws or waits: no thread is in play() any more

    // Returns at the end of the source or after stop(); the next call plays from the source's beginning, on
    // the device that is the default one by then unless setDevice() has chosen one.
    // Exceptions of source, device and callback propagate. Throws CError, without disturbing playback, while
    // another thread is in play().
    void play();
    // Toggles between paused and playing. Does nothing while a stop is under way.
    void pause();
    // Waits until play() has finished; returns at once if nothing is playing. Throws CError after the time
    // limit, which is also the result of the first stop after a play() that ended with an exception.
    void stop();
    // A call already under way still completes on the old callback.
    void setCallback(TONEWRIGHT_PlayerCallback callback) { m_callback = callback; }

    void setProgressFunction(
        std::function<void(double duration, double position, int32_t state)> function) override;
    void seek(double seconds) override;
    void setVolume(double factor) override;
    double getVolume() override;
    void setDevice(const P<peru::media::IAudioOutDevice>& device) override;
    bool enqueue(const P<sonora2::common::IAudioSource>& source) override;
    int32_t getSourceIndex() override;

private:
    static constexpr int32_t kQueueLimit = 0x500000;

    class CTurn;

    // A source whose sound is queued or heard.
    struct STitle {
        P<sonora2::common::IAudioSource> source;
        double duration = 0.0;
        double begin = 0.0;  // position of the device at which it begins to be heard
        double offset = 0.0; // seconds, added to the device's position in reports
    };
    struct SReport {
        double duration;
        double position;
        int32_t state;
    };

    CPlayer(const P<peru::IURI>& uri, const P<sonora2::common::IPluginHandler>& handler,
            const P<sonora2::common::IAudioSource>& source, uint32_t stopMilliseconds);

    // Those marked "locked" are called with m_lock held.
    void start();
    void feed();
    void fillQueue();
    bool writeNext();    // locked; false if there is nothing to write at present
    bool beginNext();    // locked; goes on reading with the next queued source
    void writeSilence(); // locked
    void idle();
    void openDevice();              // locked
    void halt();                    // locked; stops the device, closes the sources
    void haltQuietly();             // the same while an exception is propagating
    void returnUnheard();           // locked; back into the queue with what is not yet heard
    void restartAt(double seconds); // locked; drops the device's queue
    void useDevice(const P<peru::media::IAudioOutDevice>& device,
                   const P<sonora2::common::IAudioSource>& source);     // locked; throws without an effect
    void exchangeDevice(const P<peru::media::IAudioOutDevice>& device); // locked; the same, with the source
    void followDefaultDevice();                                         // locked
    bool isPastEnd();                                                   // locked
    STitle& getHeard(double position);                                  // locked; retires what has ended
    int64_t getBytesPerSecond() const;
    SReport makeReport(); // locked
    bool isObserved() const { return m_callback || m_progress.get(); }
    void report(const SReport& report) const; // not locked
    void reportState();                       // not locked

    const uint32_t m_stopMilliseconds;
    P<peru::ISignal> m_ended; // reset while play() runs and after it has thrown
    P<peru::ISignal> m_wake;  // ends the feeding thread's idle time
    P<peru::IURI> m_uri;
    P<sonora2::common::IPluginHandler> m_handler;
    const int32_t m_queueLimit = kQueueLimit; // most bytes in the device's queue, give or take one chunk
    std::atomic<int32_t> m_state{TONEWRIGHT_PLAYER_STOPPED};
    std::atomic<TONEWRIGHT_PlayerCallback> m_callback{nullptr};
    TCallbackSlot<void(double, double, int32_t)> m_progress;

    P<peru::IMutex> m_lock; // guards everything in this group
    P<peru::media::IAudioOutDevice> m_device;
    P<peru::media::CAudioFormat> m_deviceFormat;
    std::deque<STitle> m_titles; // never empty; the first is heard, the last is read
    std::deque<P<sonora2::common::IAudioSource>> m_queue;
    std::optional<double> m_startTime; // of the next play, in seconds of the source
    int64_t m_writtenBytes = 0;        // end of the queued sound, counted like the device's position
    int32_t m_sourceIndex = 0;
    bool m_isSilenceWritten = false;
    bool m_isQueueUsed = false;
    bool m_hasPlayed = false;
    bool m_isDeviceChosen = false; // by setDevice()
    double m_volume = 1.0;

    // Held by stop() throughout, and by play() only while it changes the state, so that a new play() cannot
    // reset the signal that a stop() is waiting for.
    P<peru::IMutex> m_control;
    std::atomic<bool> m_isFeeding{false};
    // Number of threads waiting for m_lock. The feeding thread releases it between chunks and would usually
    // win it back at once; it yields to these first.
    std::atomic<int32_t> m_waiting{0};
};

} // namespace tonewright
