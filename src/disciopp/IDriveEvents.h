// Where the drive manager learns of media.
#pragma once

#include <memory>
#include <string>
#include <vector>

namespace disciopp {

struct SMediumEvent {
    std::string path; // of the drive, without a slash at its end
    bool arrived = false;
};

class IDriveEvents {
public:
    virtual ~IDriveEvents() = default;
    // Watches these drives from now on. Throws peru::CError.
    virtual void watch(const std::vector<std::string>& drives) = 0;
    // Returns what has happened since the last call, or nothing after that time; -1 waits without a limit.
    virtual std::vector<SMediumEvent> wait(int milliseconds) = 0;
    // Ends a wait() in progress, or the next one. Any thread.
    virtual void wake() = 0;
    // Milliseconds that never go backwards.
    virtual int64_t getTime() = 0;
};

} // namespace disciopp
