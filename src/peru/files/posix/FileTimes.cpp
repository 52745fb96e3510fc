#include "peru/files/posix/FileTimes.h"

#include <sys/stat.h>

namespace peru::posix {
namespace {

constexpr int64_t kSecond = 1000000000;

int64_t fromTimespec(const timespec& time) {
    int64_t nanoseconds = 0;
    if (__builtin_mul_overflow(static_cast<int64_t>(time.tv_sec), kSecond, &nanoseconds) ||
        __builtin_add_overflow(nanoseconds, static_cast<int64_t>(time.tv_nsec), &nanoseconds) ||
        nanoseconds == CFileTimes::kUnknown)
        return time.tv_sec < 0 ? CFileTimes::kUnknown + 1 : std::numeric_limits<int64_t>::max();
    return nanoseconds;
}

timespec toTime(int64_t nanoseconds) {
    timespec time{};
    if (nanoseconds == CFileTimes::kUnknown) {
        time.tv_nsec = UTIME_OMIT;
        return time;
    }
    // Division rounds towards zero, but the fraction must be positive before 1970, too.
    int64_t seconds = nanoseconds / kSecond - (nanoseconds % kSecond < 0 ? 1 : 0);
    time.tv_sec = static_cast<time_t>(seconds);
    time.tv_nsec = static_cast<long>((nanoseconds % kSecond + kSecond) % kSecond);
    return time;
}

} // namespace

CFileTimes::CFileTimes(const timespec* creation, const timespec& lastAccess, const timespec& lastWrite)
    : peru::CFileTimes(creation ? fromTimespec(*creation) : kUnknown, fromTimespec(lastAccess),
                       fromTimespec(lastWrite)) {}

CFileTimes::CFileTimes(const P<peru::CFileTimes>& times)
    : peru::CFileTimes(times->getCreationTime(), times->getLastAccessTime(), times->getLastWriteTime()) {}

void CFileTimes::toTimespec(timespec (&times)[2]) const {
    times[0] = toTime(getLastAccessTime());
    times[1] = toTime(getLastWriteTime());
}

} // namespace peru::posix
