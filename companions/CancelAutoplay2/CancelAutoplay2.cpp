// Usage: CancelAutoplay2 PID dummy. Becomes CancelAutoplay2Session once the process PID has been running for
// a while: most processes end before a disc can be inserted, and the libraries that talk to the session take
// longer to load than a short job.
#include <cerrno>
#include <climits>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <poll.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace {

constexpr int kDelay = 300; // milliseconds
constexpr int kInterval = 1000;

// Whether the process has ended after at most so many milliseconds. `process` is its descriptor, or -1 if the
// kernel has none.
bool hasEnded(pid_t id, int process, int milliseconds) {
    pollfd wanted{process, POLLIN, 0};
    if (::poll(&wanted, 1, milliseconds) > 0) return true;
    return process < 0 && ::kill(id, 0) != 0 && errno == ESRCH;
}

// Returns if that program is missing.
void becomeSession(char** arguments) {
    char path[PATH_MAX];
    const ssize_t length = ::readlink("/proc/self/exe", path, sizeof path);
    constexpr char kSuffix[] = "Session";
    if (length <= 0 || static_cast<size_t>(length) + sizeof kSuffix > sizeof path) return;
    std::memcpy(path + length, kSuffix, sizeof kSuffix);
    ::execv(path, arguments);
}

} // namespace

int main(int argc, char** argv) {
    char* end = nullptr;
    const long parent = argc > 1 ? std::strtol(argv[1], &end, 10) : 0;
    if (parent <= 0 || *end != '\0') {
        std::fputs("usage: CancelAutoplay2 PROCESS-ID dummy\n", stderr);
        return 2;
    }
    const auto id = static_cast<pid_t>(parent);
    const int process = static_cast<int>(::syscall(SYS_pidfd_open, id, 0)); // closed by exec
    if (process < 0 && errno == ESRCH) return 0;
    if (hasEnded(id, process, kDelay)) return 0;
    becomeSession(argv);
    while (!hasEnded(id, process, kInterval)) {
    }
    return 0;
}
