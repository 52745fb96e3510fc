#include "peru/threads/posix/ThreadManager.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/threads/posix/ThreadImpl.h"

#include <cerrno>
#include <ctime>
#include <sched.h>

namespace peru::posix {

P<IThread> CThreadManager::createThread(const SThreadBody& body) {
    if (!body.function) throw CInvalidArgError("body", "createThread", P<IBase>::share(this));
    return CThreadImpl::start(body);
}

P<IThread> CThreadManager::createThread(const P<IAction>& action) {
    if (!action) throw CInvalidArgError("action", "createThread", P<IBase>::share(this));
    SThreadBody body;
    body.owner = PFrail<IBase>(action.get(), true);
    body.argument = action.get();
    body.function = [](IBase*, void* argument) { static_cast<IAction*>(argument)->run(); };
    return createThread(body);
}

void CThreadManager::sleep(uint32_t milliseconds) {
    timespec rest{static_cast<time_t>(milliseconds / 1000), static_cast<long>(milliseconds % 1000 * 1000000)};
    while (clock_nanosleep(CLOCK_MONOTONIC, 0, &rest, &rest) == EINTR) {
    }
}

void CThreadManager::yield(bool longer) {
    if (longer)
        sleep(1);
    else
        sched_yield();
}

P<IThread> CThreadManager::getCurrentThread() {
    return CThreadImpl::getCurrent();
}

} // namespace peru::posix

namespace peru {

P<IThreadManager> getThreadManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<IThreadManager>(
        key, [] { return P<IThreadManager>(make<posix::CThreadManager>()); });
}

} // namespace peru
