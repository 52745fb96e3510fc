#include "peru/threads/WorkerManager.h"

#include "peru/system/ITimeManager.h"

namespace peru {

CWorkerManager::CWorkerManager()
    : m_workers(make<TFrailArray<IWorker>>()), m_listeners(make<TFrailArray<IWorkLoopListener>>()) {}

CWorkerManager::~CWorkerManager() {
    while (size_t count = m_workers->getCount()) {
        IWorker* worker = m_workers->at(count - 1);
        m_workers->remove(worker); // first, since detached() may call removeWorker()
        worker->detached(this);
    }
}

void CWorkerManager::addWorker(IWorker* worker) {
    m_workers->add(worker);
    tellListeners();
    worker->attached(this);
}

bool CWorkerManager::removeWorker(IWorker* worker) {
    if (!m_workers->contains(worker)) return false;
    worker->detached(this);
    m_workers->remove(worker);
    tellListeners();
    return true;
}

void CWorkerManager::addListener(IWorkLoopListener* listener) {
    m_listeners->add(listener);
}

bool CWorkerManager::removeListener(IWorkLoopListener* listener) {
    return m_listeners->remove(listener);
}

void CWorkerManager::work() {
    m_sliceTime = getTimeManager()->getTime();
    for (size_t i = m_workers->getCount(); i-- > 0;)
        if (IWorker* worker = m_workers->at(i)) worker->work();
}

void CWorkerManager::tellListeners() {
    for (size_t i = m_listeners->getCount(); i-- > 0;)
        if (IWorkLoopListener* listener = m_listeners->at(i)) listener->workersChanged(this);
}

} // namespace peru
