#include "support/ReadAhead.h"

#include <algorithm>
#include <chrono>
#include <exception>
#include <utility>

namespace sonora2::plugins {

namespace {

// A decoder that is slower than eight chunks in this time has the consumer woken for what there is, so that
// nobody waits for chunks after the one that is needed.
constexpr auto kPatience = std::chrono::milliseconds(2);

} // namespace

CReadAhead::CReadAhead(CChunkProducer& producer, size_t limit)
    : m_producer(producer), m_limit(limit == 0 ? 0 : std::max<size_t>(limit, 2)) {}

CReadAhead::~CReadAhead() {
    if (!m_thread) return;
    {
        std::lock_guard lock(m_mutex);
        m_stopping = true;
    }
    m_drained.notify_one();
    m_thread->wait();
}

P<audio::IAudioChunk> CReadAhead::next() {
    if (!m_thread) {
        // No thread is running yet. If none is wanted or can be created, decoding continues on the caller's
        // thread.
        P<audio::IAudioChunk> chunk;
        if (m_ended || !produce(chunk, m_error))
            m_ended = true;
        else if (m_limit > 0)
            startThread();
        if (!chunk && m_error) std::exchange(m_error, nullptr)->raise();
        return chunk;
    }
    P<audio::IAudioChunk> chunk;
    P<peru::CException> error;
    bool drained = false;
    {
        std::unique_lock lock(m_mutex);
        if (m_chunks.empty() && !m_ended) waitForBatch(lock);
        if (m_chunks.empty()) {
            error = std::exchange(m_error, nullptr);
        } else {
            chunk = std::move(m_chunks.front());
            m_chunks.pop_front();
            drained = m_chunks.size() == m_limit / 2;
        }
    }
    // Waking the thread when the queue is half empty lets it decode many chunks per wake-up.
    if (drained) m_drained.notify_one();
    if (error) error->raise();
    return chunk;
}

void CReadAhead::waitForBatch(std::unique_lock<std::mutex>& lock) {
    const auto isFilled = [this] { return m_chunks.size() >= m_wanted || m_ended; };
    m_wanted = m_batch;
    if (!m_filled.wait_for(lock, kPatience, isFilled)) {
        m_wanted = 1;
        m_filled.wait(lock, isFilled);
    }
    m_wanted = 0;
    m_batch = std::min(2 * m_batch, m_limit / 2);
}

bool CReadAhead::isEnded() const {
    std::lock_guard lock(m_mutex);
    return m_ended && m_chunks.empty() && !m_error;
}

int CReadAhead::getFill() const {
    std::lock_guard lock(m_mutex);
    return m_ended || m_limit == 0 ? 100
                                   : static_cast<int>(100 * std::min(m_chunks.size(), m_limit) / m_limit);
}

void CReadAhead::startThread() {
    try {
        peru::SThreadBody body;
        body.function = &CReadAhead::runThread;
        body.argument = this;
        m_thread = peru::getThreadManager()->createThread(body);
    } catch (const peru::CException&) {
        m_thread.reset();
    }
}

void CReadAhead::runThread(peru::IBase*, void* argument) {
    static_cast<CReadAhead*>(argument)->run();
}

void CReadAhead::run() {
    for (bool more = true; more;) {
        P<audio::IAudioChunk> chunk;
        P<peru::CException> error;
        more = produce(chunk, error);
        bool isFilled;
        {
            std::lock_guard lock(m_mutex);
            if (chunk) m_chunks.push_back(std::move(chunk));
            if (!more) {
                m_error = std::move(error);
                m_ended = true;
            }
            isFilled = m_wanted > 0 && (m_chunks.size() >= m_wanted || m_ended);
        }
        if (isFilled)
            m_filled.notify_one(); // after unlocking, so that the consumer does not block on the lock
        std::unique_lock lock(m_mutex);
        if (more && m_chunks.size() >= m_limit)
            m_drained.wait(lock, [this] { return m_stopping || m_chunks.size() <= m_limit / 2; });
        if (m_stopping) return;
    }
}

bool CReadAhead::produce(P<audio::IAudioChunk>& chunk, P<peru::CException>& error) noexcept {
    try {
        chunk = m_producer.next();
        return static_cast<bool>(chunk);
    } catch (const peru::CException& thrown) {
        error = thrown.clone();
    } catch (const std::exception& thrown) {
        error = common::CSonoraError(thrown.what()).clone();
    } catch (...) {
        error = common::CSonoraError("unknown exception").clone();
    }
    return false;
}

} // namespace sonora2::plugins
