// Opens and closes tracks on a thread of its own.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"
#include "peru/threads/ISignal.h"
#include "peru/threads/IThreadManager.h"
#include "sonora2/context/ILogManager.h"
#include "sonora2/tracks/ITrack.h"

#include <deque>

namespace sonora2::common {

// The worker of a track list. Never takes the list's lock, so that a slow medium delays only threads that
// need that medium. A failure here is only logged: the track is opened again when it is due, and fails there.
//
// Used by the thread that holds the list's lock, one at a time.
class CTrackOpener : public peru::CObject {
public:
    explicit CTrackOpener(const P<ILogManager>& log); // the log may be empty
    ~CTrackOpener() override;

    void requestOpen(const P<ITrack>& track) { request(track, false); }
    void requestClose(const P<ITrack>& track) { request(track, true); }
    // Cancels all pending requests for the track and waits if the thread is busy with it. Returns true if a
    // close was pending, which is then up to the caller.
    bool claim(const P<ITrack>& track);
    // Ends the thread once its current request is done. Pending closes are performed, pending opens are
    // dropped.
    void stop();

private:
    struct SJob {
        P<ITrack> track;
        bool close;
    };

    void request(const P<ITrack>& track, bool close);
    void start();
    void run();
    bool takeJob(SJob& job);
    void perform(const SJob& job);

    P<ILogManager> m_log;
    P<peru::IThread> m_thread;
    P<peru::ISignal> m_wake; // set when there is a job, and to stop
    P<peru::ISignal> m_done; // set when a job is done
    P<peru::IMutex> m_queueMutex;
    std::deque<SJob> m_queue; // guarded by the mutex, like the next two
    ITrack* m_busyWith = nullptr;
    bool m_stopping = false;
};

} // namespace sonora2::common
