// Decodes ahead of the consumer on a thread of its own.
#pragma once

#include "peru/threads/IThreadManager.h"
#include "support/ChunkProducer.h"

#include <condition_variable>
#include <deque>
#include <mutex>

namespace sonora2::plugins {

// A bounded queue of chunks between one producer and one consumer. The thread starts behind the first chunk,
// so that a source that is only test-opened, or shorter than a chunk, never has one.
class CReadAhead {
public:
    // The producer outlives this object, and nobody else uses it meanwhile.
    CReadAhead(CChunkProducer& producer, size_t limit);
    ~CReadAhead(); // stops the thread; at most one chunk is decoded meanwhile

    // Waits for the next chunk; empty at the end. What the producer threw is thrown here, behind the last
    // chunk before it, and ends the queue.
    P<audio::IAudioChunk> next();
    bool isEnded() const; // everything was handed out
    int getFill() const;  // percent; 100 also when nothing more is to be read

private:
    void startThread();
    static void runThread(peru::IBase* owner, void* argument);
    void run();
    // One step of the producer; false behind the last one. The lock is not held.
    bool produce(P<audio::IAudioChunk>& chunk, P<peru::CException>& error) noexcept;

    CChunkProducer& m_producer;
    const size_t m_limit;
    P<peru::IThread> m_thread; // consumer's side only

    mutable std::mutex m_mutex; // guards all below
    std::condition_variable m_filled;
    std::condition_variable m_drained;
    std::deque<P<audio::IAudioChunk>> m_chunks;
    P<peru::CException> m_error; // stands behind the chunks
    bool m_ended = false;        // the producer has no more
    bool m_stopping = false;
};

} // namespace sonora2::plugins
