// Plays one source on the system's default output device.
#pragma once

#include "peru/Object.h"
#include "peru/media/IAudioOutDevice.h"
#include "peru/threads/IMutex.h"
#include "peru/threads/ISignal.h"
#include "peru/uri/IURI.h"
#include "sonora2/media/IAudioSource.h"
#include "sonora2/plugins/IPluginHandler.h"
#include "tonewright/tonewright.h"

#include <atomic>

namespace tonewright {

using peru::P;

// Has no thread of its own: play() feeds the device on the caller's thread; pause() and stop() are called
// from another. Play, pause, stop and setCallback may be called from any thread at any time, but not from the
// callback. Callers must keep the player alive during a call.
class CPlayer : public peru::CObject {
public:
    // Both throw CError if there is no suitable device, format or source. The first asks the handler for a
    // source in a format that the device supports; the second never converts, so the device must support the
    // source's own format.
    CPlayer(const P<peru::IURI>& uri, const P<sonora2::common::IPluginHandler>& handler);
    explicit CPlayer(const P<sonora2::common::IAudioSource>& source);
    ~CPlayer() override; // never throws or waits: no thread is in play() any more

    // Returns at the end of the source or after stop(); the next call plays from the source's beginning.
    // Exceptions of source, device and callback propagate. Throws CError, without disturbing playback, while
    // another thread is in play().
    void play();
    // Toggles between paused and playing. Does nothing while a stop is under way.
    void pause();
    // Waits until play() has finished; returns at once if nothing is playing. Throws CError after ten
    // seconds, which is also the result of the first stop after a play() that ended with an exception.
    void stop();
    // A call already under way still completes on the old callback.
    void setCallback(TONEWRIGHT_PlayerCallback callback) { m_callback = callback; }

private:
    static constexpr int32_t kQueueLimit = 0x500000;

    class CTurn;

    explicit CPlayer(const P<peru::IURI>& uri, const P<sonora2::common::IPluginHandler>& handler,
                     const P<sonora2::common::IAudioSource>& source);

    // Those marked "locked" are called with m_lock held.
    void start();
    void feed();
    void fillQueue(bool& isSilenceWritten);
    void writeNext(bool& isSilenceWritten); // locked
    void writeSilence();                    // locked
    void idle();
    void openDevice();  // locked
    void halt();        // locked; stops the device, closes the source
    void haltQuietly(); // the same while an exception is propagating
    bool isPastEnd() const { return m_device->getPosition() > m_duration; }
    void report() const;

    P<peru::ISignal> m_ended; // reset while play() runs and after it has thrown
    P<peru::IURI> m_uri;
    int32_t m_queueLimit = kQueueLimit; // most bytes in the device's queue, give or take one chunk
    double m_startOffset = 0.0;         // seconds, added to the device's position in reports
    double m_duration = 0.0;
    std::atomic<int32_t> m_state{TONEWRIGHT_PLAYER_STOPPED};
    P<sonora2::common::IAudioSource> m_source;
    P<peru::media::IAudioOutDevice> m_device;
    P<peru::media::CAudioFormat> m_deviceFormat;
    P<peru::IMutex> m_lock; // guards device and source between play, pause and stop
    std::atomic<TONEWRIGHT_PlayerCallback> m_callback{nullptr};

    // Held by stop() throughout, and by play() only while it changes the state, so that a new play() cannot
    // reset the signal that a stop() is waiting for.
    P<peru::IMutex> m_control;
    std::atomic<bool> m_isFeeding{false};
    // Number of threads waiting for m_lock. The feeding thread releases it between chunks and would usually
    // win it back at once; it yields to these first.
    std::atomic<int32_t> m_waiting{0};
};

} // namespace tonewright
