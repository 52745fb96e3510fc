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

// Receives the frames in their order, on the thread that calls the encoder. May throw.
class IFrameSink {
public:
    virtual ~IFrameSink() = default;
    virtual void addFrame(const uint8_t* bytes, size_t size, uint32_t samples) = 0;
    [[noreturn]] virtual void failEncoding(const char* reason) = 0;
};

// The sound is cut into runs of blocks. Helper threads encode them while the process has processors left (see
// peru::CThreadBudget); otherwise the caller's thread does. A stream of one run starts no thread. All
// functions are called by one thread; the destructor drops what has not been delivered.
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

private:
    using RunPtr = std::unique_ptr<SFrameRun>;

    void cut(size_t bytes); // from the run that is being filled
    void cutFull();
    void deliverReady(size_t most); // until at most that many runs are left
    void deliver(const SFrameRun& run);
    RunPtr takeIdle();
    void addHelpers();
    SFrameRun* takeWaiting();
    bool isDone(const SFrameRun& run);
    void waitFor(const SFrameRun& run);
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

    std::mutex m_mutex; // guards everything below, and `done` of the runs
    std::condition_variable m_work;
    std::condition_variable m_finished;
    std::deque<SFrameRun*> m_waiting; // cut, but not being encoded
    int m_shares = 0;                 // of the budget, which the helpers use or are about to use
    int m_newShares = 0;              // those that no helper has taken up
    bool m_stopping = false;
};

} // namespace sonora2::plugins::flac
