// Encodes the frames of a stream on several threads.
#pragma once

#include "peru/threads/IThreadManager.h"
#include "sonora2_flac/FrameRun.h"

#include <condition_variable>
#include <deque>
#include <memory>
#include <mutex>
#include <utility>
#include <vector>

namespace sonora2::plugins::flac {

// Receives the sound and the frames in their order; except for the sound, on the thread that calls the
// encoder.
class IFrameSink {
public:
    virtual ~IFrameSink() = default;
    // Of one run after the other, on any thread.
    virtual void addToHash(const std::vector<uint8_t>& pcm) noexcept = 0;
    // These may throw.
    virtual void addFrame(const uint8_t* bytes, size_t size, uint32_t samples) = 0;
    [[noreturn]] virtual void failEncoding(const char* reason) = 0;
};

// The sound is cut into runs of blocks. Helper threads encode them while the process has processors left (see
// peru::CThreadBudget); otherwise the caller's thread does. They also hash the sound, which would keep the
// caller from feeding many threads. A stream of one run starts no thread and is not hashed. All functions are
// called by one thread; the destructor drops what has not been delivered.
class CParallelEncoder {
public:
    static constexpr int kMostThreads = 8; // with the caller's

    CParallelEncoder(const SStreamSettings& settings, int blockFrames, IFrameSink& sink);
    ~CParallelEncoder();

    // Throws what the sink throws.
    void write(const uint8_t* pcm, int frames);
    // Delivers every whole block, except the last one, which may be the end of the stream.
    void flush();
    void finish();

    // Whether runs have been cut since the last call: otherwise the sound arrives slowly.
    bool takeProgress() { return std::exchange(m_progress, false); }
    // The beginning of the stream, as long as it is its first run, which is not being encoded yet.
    const std::vector<uint8_t>* getUncut() const { return m_nextNumber == 0 ? &m_filling->pcm : nullptr; }

    // Frames that each thread has encoded, the caller's first. For measurements.
    std::vector<size_t> getFrameCounts();

private:
    struct STask {
        SFrameRun* run = nullptr; // null for no task
        bool isHash = false;      // otherwise the run is to be encoded
    };
    using RunPtr = std::unique_ptr<SFrameRun>;

    void cut(size_t bytes); // from the run that is being filled
    void cutFull();
    void deliverReady(size_t most); // until at most that many runs are left
    void deliver(const SFrameRun& run);
    RunPtr takeIdle();
    void addHelpers();
    bool isDone(const SFrameRun& run);
    // Both with the lock, which is not held during the work.
    STask takeTask();
    void perform(const STask& task, CFrameRunEncoder& encoder, size_t worker,
                 std::unique_lock<std::mutex>& lock);
    static void runHelper(peru::IBase* owner, void* argument);
    void help();

    const SStreamSettings m_settings;
    const size_t m_blockBytes;
    const size_t m_runBytes;
    IFrameSink& m_sink;
    CFrameRunEncoder m_own;     // on the caller's thread
    std::vector<RunPtr> m_idle; // to be used again
    RunPtr m_filling;
    std::deque<RunPtr> m_runs; // cut, in the order of the stream
    uint64_t m_nextNumber = 0;
    bool m_progress = false;
    std::vector<P<peru::IThread>> m_helpers;

    std::mutex m_mutex; // guards everything below, and whether runs are encoded and hashed
    std::condition_variable m_work;
    std::condition_variable m_finished;
    std::deque<SFrameRun*> m_waiting;  // cut, but not being encoded
    std::deque<SFrameRun*> m_unhashed; // cut, but not being hashed
    bool m_isHashing = false;
    std::vector<size_t> m_frameCounts{0}; // by worker, of which 0 is the caller
    int m_shares = 0;                     // of the budget, which the helpers use or are about to use
    int m_newShares = 0;                  // those that no helper has taken up
    bool m_stopping = false;
};

} // namespace sonora2::plugins::flac
