#include "sonora2_slave/sandbox/EveryThread.h"

#include <atomic>
#include <cerrno>
#include <charconv>
#include <csignal>
#include <ctime>
#include <filesystem>
#include <set>
#include <string>
#include <sys/syscall.h>
#include <system_error>
#include <unistd.h>

namespace slave {

namespace {

// What the signal handler needs.
int (*g_call)(int) = nullptr;
int g_argument = 0;
std::atomic<int> g_error{0};
std::atomic<size_t> g_answers{0};

void onSignal(int) {
    const int before = errno;
    if (const int error = g_call(g_argument)) g_error = error;
    g_answers.fetch_add(1);
    errno = before;
}

class CSignalHandler {
public:
    explicit CSignalHandler(int signal) : m_signal(signal) {
        struct sigaction action = {};
        action.sa_handler = onSignal;
        action.sa_flags = SA_RESTART | SA_ONSTACK;
        sigfillset(&action.sa_mask);
        if (::sigaction(signal, &action, &m_previous) != 0)
            throw std::system_error(errno, std::generic_category(), "sigaction");
    }
    ~CSignalHandler() { ::sigaction(m_signal, &m_previous, nullptr); }
    CSignalHandler(const CSignalHandler&) = delete;
    CSignalHandler& operator=(const CSignalHandler&) = delete;

private:
    int m_signal;
    struct sigaction m_previous = {};
};

std::set<pid_t> listThreads() {
    std::set<pid_t> threads;
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/task")) {
        const std::string name = entry.path().filename().string();
        pid_t id = 0;
        std::from_chars(name.data(), name.data() + name.size(), id);
        threads.insert(id);
    }
    return threads;
}

bool isRunning(pid_t thread) {
    return ::syscall(SYS_tgkill, ::getpid(), thread, 0) == 0;
}

// Asks the thread and waits until it has answered or ended.
void ask(pid_t thread, int signal) {
    constexpr int kRounds = 50000; // of 0.1 ms
    const timespec pause{0, 100'000};
    const size_t before = g_answers;
    if (::syscall(SYS_tgkill, ::getpid(), thread, signal) != 0) return; // it has ended
    for (int i = 0; g_answers == before && isRunning(thread); ++i) {
        if (i == kRounds)
            throw std::system_error(ETIMEDOUT, std::generic_category(),
                                    "thread " + std::to_string(thread) + " does not respond to signals");
        ::nanosleep(&pause, nullptr);
    }
}

} // namespace

void runOnEveryThread(int (*call)(int), int argument) {
    const int signal = SIGRTMAX - 2;
    const pid_t self = static_cast<pid_t>(::syscall(SYS_gettid));
    g_call = call;
    g_argument = argument;
    g_error = 0;
    {
        const CSignalHandler handler(signal);
        std::set<pid_t> asked{self};
        // A thread that has not been asked yet may create others; those of the rest inherit the change.
        for (bool isComplete = false; !isComplete;) {
            isComplete = true;
            for (const pid_t thread : listThreads()) {
                if (!asked.insert(thread).second) continue;
                isComplete = false;
                ask(thread, signal);
            }
        }
    }
    int error = g_error;
    if (error == 0) error = call(argument);
    if (error != 0) throw std::system_error(error, std::generic_category(), "could not confine a thread");
}

} // namespace slave
