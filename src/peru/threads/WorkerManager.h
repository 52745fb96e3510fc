// The cooperative worker loop.
#pragma once

#include "peru/Object.h"
#include "peru/collections/FrailArray.h"
#include "peru/threads/IWorkerManager.h"

namespace peru {

// Iterates by index from last to first, so a worker or listener may remove itself during its own call.
// Workers that are still registered when the manager is destroyed get a detached() call.
class PERU_API CWorkerManager : public CObject, public IWorkerManager {
public:
    CWorkerManager();
    ~CWorkerManager() override;

    void addWorker(IWorker* worker) override;
    bool removeWorker(IWorker* worker) override;
    void addListener(IWorkLoopListener* listener) override;
    bool removeListener(IWorkLoopListener* listener) override;
    void work() override;

    // Start of the current or most recent slice, in milliseconds since 1970 UTC.
    int64_t getSliceTime() const { return m_sliceTime; }

private:
    void tellListeners();

    P<TFrailArray<IWorker>> m_workers;
    P<TFrailArray<IWorkLoopListener>> m_listeners;
    int64_t m_sliceTime = 0;
};

} // namespace peru
