// File times in the platform's form.
#pragma once

#include "peru/files/FileTimes.h"

#include <ctime>

namespace peru::posix {

class PERU_API CFileTimes : public peru::CFileTimes {
public:
    // `creation` is null if the file system does not record it. Times outside the range of peru::CFileTimes
    // (the years 1678 to 2261) are clamped to it.
    CFileTimes(const timespec* creation, const timespec& lastAccess, const timespec& lastWrite);
    explicit CFileTimes(const P<peru::CFileTimes>& times);

    // For utimensat: last access and last write, UTIME_OMIT if unknown.
    void toTimespec(timespec (&times)[2]) const;
};

} // namespace peru::posix
