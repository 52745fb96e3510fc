#include "peru/system/posix/TimeManager.h"

#include "peru/GlobalObjFactory.h"

#include <ctime>

namespace peru::posix {

int64_t CTimeManager::getTime() {
    timespec now;
    clock_gettime(CLOCK_REALTIME, &now);
    return int64_t{now.tv_sec} * 1000 + now.tv_nsec / 1000000;
}

int64_t CTimeManager::getMonotonicTime() {
    timespec now;
    clock_gettime(CLOCK_MONOTONIC, &now);
    return int64_t{now.tv_sec} * 1000000000 + now.tv_nsec;
}

} // namespace peru::posix

namespace peru {

P<ITimeManager> getTimeManager() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<ITimeManager>(key,
                                                [] { return P<ITimeManager>(make<posix::CTimeManager>()); });
}

} // namespace peru
