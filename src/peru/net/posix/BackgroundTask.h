// A function that runs on a thread of its own and can be waited for.
#pragma once

#include "peru/net/posix/NetEvent.h"
#include "peru/threads/IThreadManager.h"

#include <functional>

namespace peru::net::posix {

// The result is published by the event: reading it is safe once isDone() has returned true. A task that is
// dropped runs on until its function returns, holding only itself.
template <class Result> class TBackgroundTask : public CObject, public IAction {
public:
    // Throws CError if no thread can be started.
    static P<TBackgroundTask> start(std::function<Result()> function) {
        P<TBackgroundTask> task = make<TBackgroundTask>();
        task->m_function = std::move(function);
        getThreadManager()->createThread(P<IAction>(task));
        return task;
    }
    // A task that is done from the start.
    static P<TBackgroundTask> finished(Result result) {
        P<TBackgroundTask> task = make<TBackgroundTask>();
        task->m_result = std::move(result);
        task->m_done->set();
        return task;
    }

    bool isDone(const SNetWait& wait) const { return waitForEvent(*m_done, wait); }
    const Result& getResult() const { return m_result; } // the default value if the function threw

    void run() override {
        try {
            m_result = m_function();
        } catch (...) {
            m_result = Result();
        }
        m_function = nullptr;
        m_done->set();
    }

private:
    std::function<Result()> m_function;
    Result m_result{};
    P<CNetEvent> m_done = make<CNetEvent>();
};

} // namespace peru::net::posix
