// Watches some system calls of this process and lets them fail.
#pragma once

#include <functional>
#include <string>

namespace tests {

// While an object exists, `hook` is called before every fsync, fdatasync, rename, linkat, copy_file_range and
// pthread_create with the call's name and the descriptor that it writes to, or -1. The call fails with the
// errno value that the hook returns; 0 lets it through. One object at a time.
class CSystemCalls {
public:
    using Hook = std::function<int(const std::string& call, int file)>;
    explicit CSystemCalls(Hook hook);
    ~CSystemCalls();
    CSystemCalls(const CSystemCalls&) = delete;
};

} // namespace tests
