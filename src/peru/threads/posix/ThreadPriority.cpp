#include "peru/threads/posix/ThreadPriority.h"

#include <cerrno>
#include <iterator>
#include <sched.h>
#include <sys/resource.h>

namespace peru::posix {

namespace {

struct SStep {
    int policy;
    int niceValue;
};

// No real-time policies: a runaway decoder at such a priority would freeze the desktop.
constexpr SStep kSteps[] = {
    {SCHED_IDLE, 19},  {SCHED_BATCH, 10},  {SCHED_OTHER, 5},   {SCHED_OTHER, 0},
    {SCHED_OTHER, -5}, {SCHED_OTHER, -10}, {SCHED_OTHER, -20},
};
constexpr int kLowestNice = 19;

bool isRefusal(int error) {
    return error == EPERM || error == EACCES;
}

} // namespace

int setThreadPriority(pid_t thread, int step) {
    if (step < 0 || step >= static_cast<int>(std::size(kSteps))) return EINVAL;
    const SStep& wanted = kSteps[step];
    auto id = static_cast<id_t>(thread);
    sched_param parameters{};
    // The nice value first: whether a thread may leave the idle policy depends on it. Setting the current
    // value is always permitted, so the loop ends there at the latest.
    for (int value = wanted.niceValue; value <= kLowestNice; ++value) {
        if (setpriority(PRIO_PROCESS, id, value) == 0) break;
        if (!isRefusal(errno)) return errno;
    }
    if (sched_setscheduler(thread, wanted.policy, &parameters) != 0 && !isRefusal(errno)) return errno;
    return 0;
}

} // namespace peru::posix
