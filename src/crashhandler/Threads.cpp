#include "crashhandler/Threads.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <charconv>
#include <csignal>
#include <cstring>
#include <ctime>
#include <fcntl.h>
#include <limits>
#include <linux/futex.h>
#include <string_view>
#include <sys/syscall.h>
#include <unistd.h>

namespace crashhandler {

namespace {

SThreadState* g_threads = nullptr;
size_t g_count = 0;
std::atomic<size_t> g_answers{0};
std::atomic<int> g_released{0}; // a futex

void holdThread(int, siginfo_t*, void* context) {
    const int error = errno;
    const pid_t self = static_cast<pid_t>(::syscall(SYS_gettid));
    for (size_t i = 1; i < g_count; ++i) {
        if (g_threads[i].id != self) continue;
        g_threads[i].context = *static_cast<ucontext_t*>(context);
        g_threads[i].hasContext = true;
        g_answers.fetch_add(1, std::memory_order_release);
        while (g_released.load() == 0) ::syscall(SYS_futex, &g_released, FUTEX_WAIT, 0, nullptr, nullptr, 0);
        break;
    }
    errno = error;
}

// The numeric names in /proc/self/task, without opendir, which allocates.
size_t listThreads(SThreadState* threads, size_t count, size_t capacity) {
    struct SEntry {
        ino64_t inode;
        off64_t offset;
        unsigned short length;
        unsigned char type;
        char name[1];
    };
    const int folder = ::open("/proc/self/task", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (folder < 0) return count;
    alignas(SEntry) char buffer[4096];
    for (long got; (got = ::syscall(SYS_getdents64, folder, buffer, sizeof buffer)) > 0;) {
        for (long at = 0; at < got;) {
            const auto* entry = reinterpret_cast<const SEntry*>(buffer + at);
            const std::string_view name(entry->name);
            pid_t id = 0;
            const auto parsed = std::from_chars(name.data(), name.data() + name.size(), id);
            if (parsed.ec == std::errc() && id != threads[0].id && count < capacity) threads[count++].id = id;
            at += entry->length;
        }
    }
    ::close(folder);
    return count;
}

} // namespace

size_t captureThreads(const ucontext_t& crashed, SThreadState* threads, size_t capacity) {
    threads[0].id = static_cast<pid_t>(::syscall(SYS_gettid));
    threads[0].context = crashed;
    threads[0].hasContext = true;
    g_threads = threads;
    g_count = listThreads(threads, 1, capacity);

    const int signal = SIGRTMAX - 1;
    struct sigaction action = {};
    action.sa_sigaction = holdThread;
    action.sa_flags = SA_SIGINFO | SA_ONSTACK | SA_RESTART;
    sigfillset(&action.sa_mask);
    ::sigaction(signal, &action, nullptr);
    size_t asked = 0;
    for (size_t i = 1; i < g_count; ++i)
        asked += ::syscall(SYS_tgkill, ::getpid(), threads[i].id, signal) == 0;

    // A thread that blocks the signal does not respond and is listed without registers.
    constexpr int kRounds = 200;
    const timespec pause{0, 1'000'000};
    for (int i = 0; i < kRounds && g_answers.load(std::memory_order_acquire) < asked; ++i)
        ::nanosleep(&pause, nullptr);
    return g_count;
}

void releaseThreads() {
    g_released.store(1);
    ::syscall(SYS_futex, &g_released, FUTEX_WAKE, std::numeric_limits<int>::max(), nullptr, nullptr, 0);
}

} // namespace crashhandler
