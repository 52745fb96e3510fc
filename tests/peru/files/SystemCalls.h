// Watches some system calls of this process and lets them fail.
#pragma once

#include <functional>
#include <string>

namespace tests {

// While an object exists, `hook` is called before every watched call of its thread with the call's name and
// the descriptor that it works on, or -1. The call fails with the errno value that the hook returns; 0 lets
// it through, and kHalf halves the size of a transfer. One object at a time.
class CSystemCalls {
public:
#ifdef TONEWRIGHT_SANITIZED
    static constexpr bool kWatchesAll = false; // fsync, fdatasync, rename, linkat and copy_file_range only
#else
    static constexpr bool kWatchesAll = true;
#endif
    static constexpr int kHalf = -1;
    using Hook = std::function<int(const std::string& call, int file)>;
    explicit CSystemCalls(Hook hook);
    ~CSystemCalls();
    CSystemCalls(const CSystemCalls&) = delete;

private:
    Hook m_hook;
};

// A hook that interrupts each transfer before it succeeds, every other time with half of its bytes.
int interrupt(const std::string& call, int file);

struct SFailingCall {
    const char* name;
    int error;
    bool tolerated;
};
// Runs an operation with each of the failing calls, and `check` after it with the outcome.
void failEach(const std::initializer_list<SFailingCall>& calls, const std::function<void()>& run,
              const std::function<void(bool done)>& check);

} // namespace tests
