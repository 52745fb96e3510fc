// Cooperative work on a thread that somebody else owns.
#pragma once

#include "peru/P.h"

#include <cstdint>

namespace peru {

class IWorkerManager;

class PERU_API IWorker : public virtual IBase {
public:
    // Runs one slice and returns quickly. May add and remove workers, itself included.
    virtual void work() = 0;
    virtual void attached(IWorkerManager* manager) = 0;
    virtual void detached(IWorkerManager* manager) = 0;
};

class PERU_API IWorkLoopListener : public virtual IBase {
public:
    // A worker came or went.
    virtual void workersChanged(IWorkerManager* manager) = 0;
};

// Neither workers nor listeners are held: they leave before they die. Adding, removing and working happen
// on one thread; there is no lock.
class PERU_API IWorkerManager : public virtual IBase {
public:
    virtual void addWorker(IWorker* worker) = 0;
    virtual bool removeWorker(IWorker* worker) = 0; // false when it was not there
    virtual void addListener(IWorkLoopListener* listener) = 0;
    virtual bool removeListener(IWorkLoopListener* listener) = 0;
    // Runs one slice of every worker. Called now and then by the loop that owns the thread.
    virtual void work() = 0;
};

} // namespace peru
