#include "sonora2/tracks/TrackOpener.h"

#include "sonora2/context/LoggedCall.h"
#include "sonora2/tracks/TrackCommands.h"

#include <utility>

namespace sonora2::common {

namespace {

// Longest sleep of an idle worker before it checks its state.
constexpr uint32_t kIdleMilliseconds = 1000;

} // namespace

CTrackOpener::CTrackOpener(const P<ILogManager>& log)
    : m_log(log), m_wake(peru::getSignalFactory()->createSignal()),
      m_done(peru::getSignalFactory()->createSignal()), m_queueMutex(peru::getMutexFactory()->createMutex()) {
}

CTrackOpener::~CTrackOpener() {
    stop();
}

void CTrackOpener::start() {
    if (m_thread) return;
    peru::SThreadBody body;
    body.owner = peru::PFrail<peru::IBase>(this, false); // stop() waits for the thread
    body.argument = this;
    body.function = [](peru::IBase*, void* self) { static_cast<CTrackOpener*>(self)->run(); };
    m_thread = peru::getThreadManager()->createThread(body);
}

void CTrackOpener::request(const P<ITrack>& track, bool close) {
    start();
    peru::CMutexLock lock(m_queueMutex);
    m_queue.push_back({track, close});
    m_wake->set();
}

bool CTrackOpener::claim(const P<ITrack>& track) {
    bool closePending = false;
    while (true) {
        {
            peru::CMutexLock lock(m_queueMutex);
            std::erase_if(m_queue, [&](const SJob& job) {
                if (job.track != track) return false;
                closePending = closePending || job.close;
                return true;
            });
            if (m_busyWith != track.get()) return closePending;
            m_done->reset();
        }
        m_done->wait();
    }
}

void CTrackOpener::stop() {
    if (!m_thread) return;
    {
        peru::CMutexLock lock(m_queueMutex);
        m_stopping = true;
        m_wake->set();
    }
    m_thread->wait();
    m_thread.reset();
    m_stopping = false;
    for (const SJob& job : std::exchange(m_queue, {}))
        if (job.close) perform(job);
}

void CTrackOpener::run() {
    while (true) {
        {
            peru::CMutexLock lock(m_queueMutex);
            if (m_stopping) return;
            if (m_queue.empty()) m_wake->reset();
        }
        SJob job;
        if (!takeJob(job)) {
            m_wake->wait(kIdleMilliseconds);
            continue;
        }
        perform(job);
        peru::CMutexLock lock(m_queueMutex);
        m_busyWith = nullptr;
        m_done->set();
    }
}

bool CTrackOpener::takeJob(SJob& job) {
    peru::CMutexLock lock(m_queueMutex);
    if (m_queue.empty()) return false;
    job = std::move(m_queue.front());
    m_queue.pop_front();
    m_busyWith = job.track.get();
    return true;
}

void CTrackOpener::perform(const SJob& job) {
    callLogged(m_log,
               [&] { job.track->processCommand(peru::make<COpenThreadIndependentCommand>("", job.close)); });
}

} // namespace sonora2::common
