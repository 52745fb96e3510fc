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

// It has no thread of its own: play feeds the device on the caller's thread, and pause and stop come from
// another. Play, pause, stop and setCallback may be called by any thread at any time, but not from the
// callback; the caller keeps the player alive while it is inside.
class CPlayer : public peru::CObject {
public:
    // Both throw CError where there is no device, no format or no source that serves. The first one asks the
    // handler for a source in a format of the device; the second one converts nothing, so that a device
    // which does not take the source's own format has none for it.
    CPlayer(const P<peru::IURI>& uri, const P<sonora2::common::IPluginHandler>& handler);
    explicit CPlayer(const P<sonora2::common::IAudioSource>& source);
    ~CPlayer() override; // never throws and never waits: nobody is in play any more

    // Returns at the end of the source or after stop, and then the player can play again from the source's
    // beginning. What source, device and callback throw passes through. Throws CError, and disturbs nothing,
    // while another thread plays.
    void play();
    // A toggle. Does nothing while a stop is under way.
    void pause();
    // Returns when play has ended its work, at once where nothing plays. Throws CError after ten seconds of
    // waiting, which pass in vain after a play that ended by an exception.
    void stop();
    // A call that is already under way still ends on the old one.
    void setCallback(TONEWRIGHT_PlayerCallback callback) { m_callback = callback; }

private:
    static constexpr int32_t kQueueLimit = 0x500000;

    class CTurn;

    explicit CPlayer(const P<peru::IURI>& uri, const P<sonora2::common::IPluginHandler>& handler,
                     const P<sonora2::common::IAudioSource>& source);

    // What they are made of. The caller of those marked so holds m_lock.
    void start();
    void feed();
    void fillQueue(bool& isSilenceWritten);
    void writeNext(bool& isSilenceWritten); // locked
    void writeSilence();                    // locked
    void idle();
    void openDevice();  // locked
    void halt();        // locked; stops the device, closes the source
    void haltQuietly(); // the same for when an error is on its way already
    bool isPastEnd() const { return m_device->getPosition() > m_duration; }
    void report() const;

    P<peru::ISignal> m_ended; // set unless a play is under way or has ended by an exception
    P<peru::IURI> m_uri;
    int32_t m_queueLimit = kQueueLimit; // bytes that lie in the device's queue at most, but for one chunk
    double m_startOffset = 0.0;         // seconds, added to the device's position in reports
    double m_duration = 0.0;
    std::atomic<int32_t> m_state{TONEWRIGHT_PLAYER_STOPPED};
    P<sonora2::common::IAudioSource> m_source;
    P<peru::media::IAudioOutDevice> m_device;
    P<peru::media::CAudioFormat> m_deviceFormat;
    P<peru::IMutex> m_lock; // guards device and source between play, pause and stop
    std::atomic<TONEWRIGHT_PlayerCallback> m_callback{nullptr};

    // Held by stop from its request to its end, and by play only while it turns the state: a play cannot
    // take the signal away that a stop waits for.
    P<peru::IMutex> m_control;
    std::atomic<bool> m_isFeeding{false};
    // Threads that want m_lock. The feeding thread gives it away between two chunks and would mostly get it
    // back first; it waits for these.
    std::atomic<int32_t> m_waiting{0};
};

} // namespace tonewright
