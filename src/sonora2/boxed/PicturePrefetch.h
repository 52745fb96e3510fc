// Fetches pictures before they are wanted.
#pragma once

#include "peru/Exception.h"
#include "peru/threads/IMutex.h"
#include "peru/threads/ISignal.h"
#include "peru/threads/IThreadManager.h"
#include "sonora2/media/ISonoraPicture.h"

#include <atomic>
#include <cstdint>
#include <deque>
#include <functional>

namespace sonora2::common {

// Hides the latency of the pipe with up to 3 pictures. One thread takes them.
class SONORA2_API CPicturePrefetch {
public:
    enum class EFetched { picture, end };
    // Runs on the prefetching thread: calls the function that it is given under the lock that makes changes
    // of the position, fetches the next picture, and may throw.
    using Fetch = std::function<EFetched(const std::function<void()>& locked, P<ISonoraPicture>& picture)>;

    explicit CPicturePrefetch(Fetch fetch);
    ~CPicturePrefetch(); // stops
    CPicturePrefetch(const CPicturePrefetch&) = delete;
    CPicturePrefetch& operator=(const CPicturePrefetch&) = delete;

    void start(); // no effect on a running thread
    void stop();  // returns when the thread has ended; must not be called under the lock
    bool isRunning() const { return m_running; }
    // Drops what was fetched; called under the lock when the position changes.
    void clear();
    // Whether the source has no picture left. Waits for a picture that is on its way: it has left the slave,
    // which is at its end then. False after an error, which take() throws.
    bool isAtEnd() const;

    // The next picture; empty as the source has returned it, and at the end. Throws an error of the thread,
    // or CError if nothing arrives in time.
    P<ISonoraPicture> take();
    // The same without taking it.
    P<ISonoraPicture> peek();

private:
    void work();
    void append(const P<ISonoraPicture>& picture, uint64_t generation, bool isEnd);
    bool isPending() const; // neither a picture nor the end nor an error has arrived in time
    void waitForPicture();

    Fetch m_fetch;
    P<peru::IMutex> m_mutex; // guards the members up to m_failure; taken alone
    std::deque<P<ISonoraPicture>> m_pictures;
    uint64_t m_generation = 0; // counts calls of clear()
    bool m_isAtEnd = false;
    P<peru::CException> m_failure;
    P<peru::ISignal> m_stop;
    P<peru::ISignal> m_moreWanted;
    std::atomic<bool> m_running{false};
    P<peru::IThread> m_thread;
};

} // namespace sonora2::common
