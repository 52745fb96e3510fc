#include "FaultyCalls.h"

#include <array>
#include <cerrno>
#include <csignal>
#include <cstddef>
#include <cstdlib>
#include <fcntl.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <poll.h>
#include <span>
#include <sys/ioctl.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

namespace tests {

namespace {

constexpr int kFileCalls[] = {
#ifdef SYS_open
    SYS_open,      SYS_rename,    SYS_link,
#endif
    SYS_openat,    SYS_read,      SYS_pread64,   SYS_readv,     SYS_write,
    SYS_pwrite64,  SYS_writev,    SYS_sendfile,  SYS_fsync,     SYS_fdatasync,
    SYS_fchmod,    SYS_fchown,    SYS_fchownat,  SYS_fchmodat,  SYS_linkat,
    SYS_renameat,  SYS_renameat2, SYS_ftruncate, SYS_fallocate, SYS_copy_file_range,
    SYS_fsetxattr, SYS_setxattr,  SYS_utimensat};

constexpr int kNetworkCalls[] = {
#ifdef SYS_open
    SYS_open,     SYS_poll,
#endif
    SYS_openat,   SYS_read,       SYS_write,      SYS_socket,   SYS_connect, SYS_sendto,
    SYS_recvfrom, SYS_getsockopt, SYS_setsockopt, SYS_eventfd2, SYS_ppoll};

// Returns the descriptor on which the kernel notifies about each of these calls; -1 if unsupported.
int watchCalls(std::span<const int> calls) {
    std::vector<sock_filter> filter = {BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr))};
    for (const int call : calls) {
        filter.push_back(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<uint32_t>(call), 0, 1));
        filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_USER_NOTIF));
    }
    filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW));
    const sock_fprog program{static_cast<unsigned short>(filter.size()), filter.data()};
    if (::prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0) return -1;
    return static_cast<int>(
        ::syscall(SYS_seccomp, SECCOMP_SET_MODE_FILTER, SECCOMP_FILTER_FLAG_NEW_LISTENER, &program));
}

// sendmsg and recvmsg are not among the intercepted calls.
void report(int channel, const void* data, size_t size) {
    iovec part{const_cast<void*>(data), size};
    msghdr message{};
    message.msg_iov = &part;
    message.msg_iovlen = 1;
    ::sendmsg(channel, &message, 0);
}

bool awaitGo(int channel) {
    char go = 0;
    iovec part{&go, 1};
    msghdr message{};
    message.msg_iov = &part;
    message.msg_iovlen = 1;
    return ::recvmsg(channel, &message, 0) == 1;
}

[[noreturn]] void runChild(int channel, ECalls calls,
                           const std::function<std::function<std::string()>()>& prepare) {
    const std::function<std::string()> operation = prepare();
    const int listener =
        watchCalls(calls == ECalls::files ? std::span<const int>(kFileCalls) : kNetworkCalls);
    report(channel, &listener, sizeof listener);
    if (!awaitGo(channel)) ::_exit(1);
    const std::string result = operation();
    report(channel, result.data(), result.size());
    ::_exit(0);
}

bool isRenaming(int call) {
#ifdef SYS_rename
    if (call == SYS_rename) return true;
#endif
    return call == SYS_renameat || call == SYS_renameat2;
}

// A sanitizer writes to a pipe to find out whether memory is readable; nothing else here uses pipes.
bool isOfSanitizer(const seccomp_notif& question) {
    if (question.data.nr != SYS_write) return false;
    const std::string link =
        "/proc/" + std::to_string(question.pid) + "/fd/" + std::to_string(question.data.args[0]);
    std::array<char, 64> target{};
    return ::readlink(link.c_str(), target.data(), target.size() - 1) > 0 &&
           std::string(target.data()).starts_with("pipe:");
}

// Answers one notification: lets the call continue, fails it, or kills the child.
void answer(int listener, const seccomp_notif& question, const SFault& fault, bool strikes, pid_t child) {
    if (strikes && fault.error == 0) {
        ::kill(child, SIGKILL);
        return;
    }
    seccomp_notif_resp response{};
    response.id = question.id;
    if (strikes)
        response.error = -fault.error;
    else
        response.flags = SECCOMP_USER_NOTIF_FLAG_CONTINUE;
    ::ioctl(listener, SECCOMP_IOCTL_NOTIF_SEND, &response);
}

void answerAll(int listener, const SFault& fault, pid_t child, SFaultyRun& run) {
    for (int calls = 0;;) {
        pollfd waiting{listener, POLLIN, 0};
        if (::poll(&waiting, 1, 60'000) <= 0) {
            ::kill(child, SIGKILL); // timed out
            return;
        }
        if (waiting.revents & POLLHUP) return;
        seccomp_notif question{};
        if (::ioctl(listener, SECCOMP_IOCTL_NOTIF_RECV, &question) != 0) continue;
        const bool counts = !isOfSanitizer(question);
        calls += counts;
        const bool strikes =
            counts && fault.call != 0 && (calls == fault.call || (fault.forGood && calls > fault.call));
        if (strikes && !run.struck) run.renaming = isRenaming(question.data.nr);
        run.struck = run.struck || strikes;
        answer(listener, question, fault, strikes, child);
    }
}

} // namespace

SFaultyRun runWithFault(const SFault& fault, const std::function<std::function<std::string()>()>& prepare) {
    int channel[2];
    if (::socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, channel) != 0) std::abort();
    const pid_t child = ::fork();
    if (child == 0) {
        ::close(channel[0]);
        runChild(channel[1], fault.calls, prepare);
    }
    ::close(channel[1]);

    SFaultyRun run;
    int remote = -1;
    if (::recv(channel[0], &remote, sizeof remote, 0) == sizeof remote) {
        const int process = static_cast<int>(::syscall(SYS_pidfd_open, child, 0));
        const int listener =
            remote < 0 ? -1 : static_cast<int>(::syscall(SYS_pidfd_getfd, process, remote, 0));
        run.supported = listener >= 0;
        if (run.supported) {
            ::send(channel[0], "g", 1, 0);
            answerAll(listener, fault, child, run);
        } else {
            ::kill(child, SIGKILL);
        }
        ::close(listener);
        ::close(process);
    }
    ::waitpid(child, &run.status, 0);
    std::array<char, 4096> report;
    const ssize_t length = ::recv(channel[0], report.data(), report.size(), 0);
    if (length > 0) run.report.assign(report.data(), static_cast<size_t>(length));
    ::close(channel[0]);
    return run;
}

} // namespace tests
