// Cooperative work on a thread owned by someone else.
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
    // A worker was added or removed.
    virtual void workersChanged(IWorkerManager* manager) = 0;
};

// Holds no references to workers and listeners: they must be removed before they are destroyed. Not
// thread-safe: add, remove and work are all called on one thread.
class PERU_API IWorkerManager : public virtual IBase {
public:
    virtual void addWorker(IWorker* worker) = 0;
    virtual bool removeWorker(IWorker* worker) = 0; // false if it was not registered
    virtual void addListener(IWorkLoopListener* listener) = 0;
    virtual bool removeListener(IWorkLoopListener* listener) = 0;
    // Runs one slice of every worker. Called regularly by the loop that owns the thread.
    virtual void work() = 0;
};

} // namespace peru
