#include "sonora2_flac/ParallelEncoder.h"

#include "peru/threads/ThreadBudget.h"

#include <algorithm>
#include <utility>

namespace sonora2::plugins::flac {

namespace {

// A run is some milliseconds of work, far more than it costs to hand it over.
constexpr size_t kRunBytes = 512 * 1024;
constexpr size_t kRunsPerThread = 2;

int getMostHelpers() {
    return std::min(peru::getThreadBudget().getLimit(), CParallelEncoder::kMostThreads) - 1;
}

} // namespace

CParallelEncoder::CParallelEncoder(const SStreamSettings& settings, int blockFrames, IFrameSink& sink)
    : m_settings(settings), m_blockBytes(static_cast<size_t>(blockFrames) * settings.format.frameBytes()),
      m_runBytes(std::max<size_t>(kRunBytes / m_blockBytes, 1) * m_blockBytes), m_sink(sink), m_own(settings),
      m_filling(takeIdle()) {}

CParallelEncoder::~CParallelEncoder() {
    {
        std::lock_guard lock(m_mutex);
        m_stopping = true;
    }
    m_work.notify_all();
    for (const P<peru::IThread>& helper : m_helpers) helper->wait();
    for (; m_newShares > 0; --m_newShares) peru::getThreadBudget().leave();
}

void CParallelEncoder::write(const uint8_t* pcm, int frames) {
    size_t left = static_cast<size_t>(frames) * m_settings.format.frameBytes();
    while (left > 0) {
        // A full run is cut once more sound follows: the last one may be encoded otherwise.
        if (m_filling->pcm.size() == m_runBytes) cutFull();
        std::vector<uint8_t>& filling = m_filling->pcm;
        const size_t count = std::min(left, m_runBytes - filling.size());
        filling.insert(filling.end(), pcm, pcm + count);
        pcm += count;
        left -= count;
    }
}

void CParallelEncoder::flush() {
    const size_t size = m_filling->pcm.size();
    if (size > m_blockBytes) cut((size - 1) / m_blockBytes * m_blockBytes);
    deliverReady(0);
}

void CParallelEncoder::finish() {
    if (!m_filling->pcm.empty()) cut(m_filling->pcm.size());
    deliverReady(0);
}

void CParallelEncoder::cutFull() {
    cut(m_runBytes);
    m_progress = true;
    addHelpers();
    deliverReady(kRunsPerThread * static_cast<size_t>(getMostHelpers() + 1));
}

void CParallelEncoder::cut(size_t bytes) {
    RunPtr next = takeIdle();
    std::vector<uint8_t>& pcm = m_filling->pcm;
    next->pcm.assign(pcm.begin() + static_cast<ptrdiff_t>(bytes), pcm.end());
    pcm.resize(bytes);
    m_filling->firstNumber = m_nextNumber;
    m_nextNumber += (bytes + m_blockBytes - 1) / m_blockBytes;
    m_runs.push_back(std::exchange(m_filling, std::move(next)));
    std::lock_guard lock(m_mutex);
    m_waiting.push_back(m_runs.back().get());
    m_unhashed.push_back(m_runs.back().get());
}

void CParallelEncoder::deliverReady(size_t most) {
    while (!m_runs.empty()) {
        SFrameRun& first = *m_runs.front();
        if (isDone(first)) {
            deliver(first);
            m_idle.push_back(std::move(m_runs.front()));
            m_runs.pop_front();
            continue;
        }
        // What no helper takes is the caller's work.
        std::unique_lock lock(m_mutex);
        if (m_shares > 0 && m_runs.size() <= most) return;
        if (const STask task = takeTask(); task.run)
            perform(task, m_own, 0, lock);
        else
            m_finished.wait(lock, [&first] { return first.isDone(); });
    }
}

void CParallelEncoder::deliver(const SFrameRun& run) {
    if (!run.failure.empty()) m_sink.failEncoding(run.failure.c_str());
    const uint8_t* at = run.encoded.data();
    for (const SFrameRun::SFrame& frame : run.frames) {
        m_sink.addFrame(at, frame.bytes, frame.samples);
        at += frame.bytes;
    }
}

CParallelEncoder::RunPtr CParallelEncoder::takeIdle() {
    if (m_idle.empty()) {
        RunPtr run = std::make_unique<SFrameRun>();
        run->pcm.reserve(m_runBytes);
        return run;
    }
    RunPtr run = std::move(m_idle.back());
    m_idle.pop_back();
    run->pcm.clear();
    run->isEncoded = run->isHashed = false;
    return run;
}

void CParallelEncoder::addHelpers() {
    const int most = getMostHelpers();
    while (true) {
        int shares;
        {
            std::lock_guard lock(m_mutex);
            const int wanted =
                static_cast<int>(std::min<size_t>(m_waiting.size(), static_cast<size_t>(most)));
            if (m_newShares >= wanted || m_shares >= most || !peru::getThreadBudget().tryEnter()) return;
            shares = ++m_shares;
            ++m_newShares;
        }
        m_work.notify_one();
        if (static_cast<int>(m_helpers.size()) >= shares) continue;
        try {
            peru::SThreadBody body;
            body.function = &CParallelEncoder::runHelper;
            body.argument = this;
            m_helpers.push_back(peru::getThreadManager()->createThread(body));
        } catch (const peru::CException&) {
            std::lock_guard lock(m_mutex);
            if (m_newShares == 0) return; // another helper has taken it up
            --m_newShares;
            --m_shares;
            return peru::getThreadBudget().leave();
        }
    }
}

bool CParallelEncoder::isDone(const SFrameRun& run) {
    std::lock_guard lock(m_mutex);
    return run.isDone();
}

// Hashing comes first: only one thread can do it at a time, and every run waits for the one before.
CParallelEncoder::STask CParallelEncoder::takeTask() {
    const bool isHash = !m_isHashing && !m_unhashed.empty();
    std::deque<SFrameRun*>& queue = isHash ? m_unhashed : m_waiting;
    if (queue.empty()) return {};
    const STask task{queue.front(), isHash};
    queue.pop_front();
    m_isHashing = m_isHashing || isHash;
    return task;
}

void CParallelEncoder::perform(const STask& task, CFrameRunEncoder& encoder, size_t worker,
                               std::unique_lock<std::mutex>& lock) {
    SFrameRun& run = *task.run;
    lock.unlock();
    if (task.isHash)
        m_sink.addToHash(run.pcm);
    else
        encoder.encode(run);
    lock.lock();
    if (task.isHash) {
        m_isHashing = false;
        run.isHashed = true;
    } else {
        m_frameCounts[worker] += run.frames.size();
        run.isEncoded = true;
    }
    if (run.isDone()) m_finished.notify_one();
}

std::vector<size_t> CParallelEncoder::getFrameCounts() {
    std::lock_guard lock(m_mutex);
    return m_frameCounts;
}

void CParallelEncoder::runHelper(peru::IBase*, void* argument) {
    static_cast<CParallelEncoder*>(argument)->help();
}

void CParallelEncoder::help() {
    CFrameRunEncoder encoder(m_settings);
    std::unique_lock lock(m_mutex);
    const size_t worker = m_frameCounts.size();
    m_frameCounts.push_back(0);
    while (true) {
        m_work.wait(lock, [this] { return m_stopping || m_newShares > 0; });
        if (m_stopping) return;
        --m_newShares;
        while (!m_stopping) {
            const STask task = takeTask();
            if (!task.run) break;
            perform(task, encoder, worker, lock);
        }
        --m_shares;
        peru::getThreadBudget().leave();
    }
}

} // namespace sonora2::plugins::flac
