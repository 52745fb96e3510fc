#include "peru/threads/OrderedParts.h"

#include "peru/Errors.h"
#include "peru/threads/IThreadManager.h"

#include <algorithm>
#include <condition_variable>
#include <mutex>
#include <vector>

namespace peru {

namespace {

class CRun {
public:
    explicit CRun(const SOrderedParts& parts)
        : m_parts(parts), m_window(std::max<size_t>(parts.window, 1)), m_isDone(m_window) {}
    ~CRun();
    CRun(const CRun&) = delete;
    CRun& operator=(const CRun&) = delete;

    bool run();

private:
    struct SHelper {
        CRun* run;
        int worker;
    };

    void startHelpers();
    void help(int worker);
    bool canTake() const { return m_next < m_parts.count && m_next < m_delivered + m_window; }
    void workOnNext(std::unique_lock<std::mutex>& lock, int worker);

    const SOrderedParts& m_parts;
    const size_t m_window;
    std::vector<SHelper> m_helpers;
    std::vector<P<IThread>> m_threads;

    std::mutex m_mutex; // guards everything below
    std::condition_variable m_changed;
    std::vector<char> m_isDone; // by part modulo window
    size_t m_next = 0;          // part that nobody has taken
    size_t m_delivered = 0;     // parts
    bool m_stopping = false;
};

CRun::~CRun() {
    {
        std::lock_guard lock(m_mutex);
        m_stopping = true;
    }
    m_changed.notify_all();
    for (const P<IThread>& thread : m_threads) thread->wait();
}

void CRun::startHelpers() {
    m_helpers.reserve(static_cast<size_t>(std::max(m_parts.helpers, 0)));
    try {
        for (int worker = 1; worker <= m_parts.helpers; ++worker) {
            SThreadBody body;
            body.function = [](IBase*, void* argument) {
                const auto* helper = static_cast<SHelper*>(argument);
                helper->run->help(helper->worker);
            };
            m_helpers.push_back({this, worker});
            body.argument = &m_helpers.back();
            m_threads.push_back(getThreadManager()->createThread(body));
        }
    } catch (const CException&) {
        // No more threads available: the existing ones do all the work.
    }
}

void CRun::help(int worker) {
    std::unique_lock lock(m_mutex);
    while (true) {
        m_changed.wait(lock, [this] { return m_stopping || m_next == m_parts.count || canTake(); });
        if (m_stopping || m_next == m_parts.count) return;
        workOnNext(lock, worker);
    }
}

void CRun::workOnNext(std::unique_lock<std::mutex>& lock, int worker) {
    const size_t part = m_next++;
    lock.unlock();
    m_parts.work(part, worker);
    lock.lock();
    m_isDone[part % m_window] = 1;
    m_changed.notify_all();
}

bool CRun::run() {
    startHelpers();
    std::unique_lock lock(m_mutex);
    while (m_delivered < m_parts.count) {
        char& isDone = m_isDone[m_delivered % m_window];
        if (isDone) {
            lock.unlock();
            if (!m_parts.deliver(m_delivered)) return false;
            lock.lock();
            isDone = 0;
            ++m_delivered;
            m_changed.notify_all();
        } else if (canTake()) {
            workOnNext(lock, 0);
        } else {
            m_changed.wait(lock, [&isDone] { return isDone != 0; });
        }
    }
    return true;
}

} // namespace

CIdleThreads::CIdleThreads(int most) {
    while (m_count < most && getThreadBudget().tryEnter()) ++m_count;
}

CIdleThreads::~CIdleThreads() {
    for (; m_count > 0; --m_count) getThreadBudget().leave();
}

bool runInOrder(const SOrderedParts& parts) {
    return CRun(parts).run();
}

} // namespace peru
