// Decodes ahead of the consumer on a separate thread.
#pragma once

#include "peru/threads/IThreadManager.h"
#include "support/ChunkProducer.h"

#include <condition_variable>
#include <deque>
#include <mutex>

namespace sonora2::plugins {

// A bounded queue of chunks between one producer and one consumer. The thread starts after the first chunk,
// so a source that is only opened as a test, or is shorter than a chunk, never starts one. A consumer that
// finds the queue empty is woken for one chunk, then two, and so on up to half of the queue, which saves most
// changes between the threads; if these take longer than a few milliseconds, for a single chunk.
class CReadAhead {
public:
    // The producer must outlive this object and must not be used by anyone else meanwhile. Without a limit in
    // chunks, 0, every chunk is decoded on the caller's thread when it is asked for.
    CReadAhead(CChunkProducer& producer, size_t limit);
    ~CReadAhead(); // stops the thread after the chunk that it is decoding

    // Waits for the next chunk; empty at the end. An exception of the producer is rethrown here after the
    // chunks that precede it, and ends the queue.
    P<audio::IAudioChunk> next();
    bool isEnded() const; // everything has been delivered
    int getFill() const;  // percent; 100 also when there is nothing left to read

private:
    void startThread();
    static void runThread(peru::IBase* owner, void* argument);
    void run();
    void waitForBatch(std::unique_lock<std::mutex>& lock);
    // Runs one step of the producer; returns false after the last one. Called without the lock.
    bool produce(P<audio::IAudioChunk>& chunk, P<peru::CException>& error) noexcept;

    CChunkProducer& m_producer;
    const size_t m_limit;
    P<peru::IThread> m_thread; // used by the consumer only
    size_t m_batch = 1;        // as well: chunks to be woken for the next time

    mutable std::mutex m_mutex; // guards everything below
    std::condition_variable m_filled;
    std::condition_variable m_drained;
    std::deque<P<audio::IAudioChunk>> m_chunks;
    size_t m_wanted = 0;         // chunks that the consumer waits for; 0 while it runs
    P<peru::CException> m_error; // to be thrown after the chunks
    bool m_ended = false;        // the producer has reached its end
    bool m_stopping = false;
};

} // namespace sonora2::plugins
