// A player, its queue and the thread that runs it.
#pragma once

#include "library/Library.h"
#include "media/PlaySource.h"

#include <atomic>
#include <memory>
#include <string>
#include <thread>

namespace host {

// Plays sources one after the other without gaps. One thread uses it; its own threads share the player.
class CPlaySession {
public:
    struct SState {
        double position = 0; // seconds, in the source that is heard
        bool isPaused = false;
    };

    // The player's source must not be used otherwise. `device` is an id; empty for the default device. Throws
    // std::runtime_error if no device supports the source's format.
    CPlaySession(CLibrary& library, const CHandle& source, const std::string& device);
    // Stops the player. Stopping one that is failing at the same time takes ten seconds; its thread is not
    // waited for.
    ~CPlaySession();
    CPlaySession(const CPlaySession&) = delete;
    CPlaySession& operator=(const CPlaySession&) = delete;

    // Whether the thread of a session is still running; then the library must not be unloaded.
    static bool isAnyAlive();

    void start(double seconds);          // the position in the first source
    bool enqueue(const CHandle& source); // false if the player takes nothing more
    int getIndex() const;                // of the source that is heard
    SState getState() const;
    bool hasBegun() const; // there has been sound
    bool hasEnded() const; // by itself, by stop() or by a failure
    // Both ignored before playback has begun.
    void togglePause();
    void stop(); // returns at once; hasEnded() follows
    void seek(double seconds);
    void setVolume(double factor);

    // Waits for the end and returns why the player failed, otherwise an empty text.
    std::string finish();

private:
    class CShared;

    const std::shared_ptr<CShared> m_shared;
    std::thread m_player;
    std::thread m_stopper;
};

} // namespace host
