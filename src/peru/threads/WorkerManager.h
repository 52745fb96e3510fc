// The cooperative worker loop.
#pragma once

#include "peru/Object.h"
#include "peru/collections/FrailArray.h"
#include "peru/threads/IWorkerManager.h"

namespace peru {

// Walks from the last to the first by index, so that a worker or listener may leave during its own call.
// A worker that is still present at the end is told that it is detached.
class PERU_API CWorkerManager : public CObject, public IWorkerManager {
public:
    CWorkerManager();
    ~CWorkerManager() override;

    void addWorker(IWorker* worker) override;
    bool removeWorker(IWorker* worker) override;
    void addListener(IWorkLoopListener* listener) override;
    bool removeListener(IWorkLoopListener* listener) override;
    void work() override;

    // When the slice that runs, or the last one, began: milliseconds since 1970 UTC.
    int64_t getSliceTime() const { return m_sliceTime; }

private:
    void tellListeners();

    P<TFrailArray<IWorker>> m_workers;
    P<TFrailArray<IWorkLoopListener>> m_listeners;
    int64_t m_sliceTime = 0;
};

} // namespace peru
