#include "sonora2_slave/sandbox/JobAccess.h"

#include "peru/files/IFileReplacement.h"
#include "peru/system/ISystem.h"
#include "support/Files.h"
#include "support/TempFolder.h"

#include <atomic>
#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <functional>
#include <iconv.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sched.h>
#include <sys/ioctl.h>
#include <sys/mman.h>
#include <sys/mount.h>
#include <sys/prctl.h>
#include <sys/ptrace.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace {

using namespace tests;
using slave::enterSandbox;
using slave::SSandbox;

constexpr int kEntryFailed = 254;

// The result of `body` in another process, a number from 0 to 253; negative if a signal has ended that
// process.
int inChild(const std::function<int()>& body) {
    const pid_t child = ::fork();
    if (child == 0) {
        ::alarm(60);
        try {
            ::_exit(body());
        } catch (const std::exception&) {
            ::_exit(kEntryFailed);
        }
    }
    int status = 0;
    ::waitpid(child, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
}

// The result of `attempt`, 0 or an errno value, in a process that is confined before it makes the attempt.
int inside(const SSandbox& sandbox, const std::function<int()>& attempt) {
    return inChild([&] {
        enterSandbox(sandbox);
        return attempt();
    });
}

int errorIf(bool failed) {
    return failed ? errno : 0;
}

int tryOpen(const std::filesystem::path& path, int flags) {
    const int file = ::open(path.c_str(), flags | O_CLOEXEC, 0600);
    if (file < 0) return errno;
    ::close(file);
    return 0;
}

template <class... Arguments> int tryCall(long number, Arguments... arguments) {
    return errorIf(::syscall(number, arguments...) < 0);
}

class Sandbox : public testing::Test {
protected:
    std::filesystem::path write(const std::string& name, const std::string& bytes) const {
        std::filesystem::create_directories((m_folder / name).parent_path());
        return m_folder.write(name, bytes);
    }

    CTempFolder m_folder;
    const std::filesystem::path m_medium = write("music/a.wav", "sound");
    const std::filesystem::path m_other = write("music/private.txt", "secret");
    const std::filesystem::path m_crashLog = write("log/crash", "");
    const std::filesystem::path m_target = write("out/old.wav", "old");

    SSandbox reading() const {
        SSandbox sandbox = slave::allowReading(m_medium);
        sandbox.writable = {m_crashLog};
        return sandbox;
    }
};

} // namespace

TEST_F(Sandbox, RefusesWhatACodecHasNoUseFor) {
    const pid_t parent = ::getpid();
    const int medium = ::open(m_medium.c_str(), O_RDONLY | O_CLOEXEC);
    const std::string parentMemory = "/proc/" + std::to_string(parent) + "/mem";
    const rlimit higher{1000, 1000};
    const auto execute = [] {
        char* const arguments[] = {const_cast<char*>("true"), nullptr};
        return errorIf(::execv("/bin/true", arguments) < 0);
    };
    const struct {
        const char* name;
        std::function<int()> attempt;
        int error = EPERM;
    } cases[] = {
        {"read a file outside", [&] { return tryOpen(m_other, O_RDONLY); }, EACCES},
        {"list a folder", [&] { return tryOpen(m_folder / "music", O_RDONLY | O_DIRECTORY); }, EACCES},
        {"read the user database", [] { return tryOpen("/etc/passwd", O_RDONLY); }, EACCES},
        {"read the host's memory", [&] { return tryOpen(parentMemory, O_RDONLY); }, EACCES},
        {"write to the medium", [&] { return tryOpen(m_medium, O_WRONLY); }, EACCES},
        {"truncate the medium", [&] { return tryOpen(m_medium, O_RDONLY | O_TRUNC); }},
        {"truncate with no access", [&] { return tryOpen(m_medium, O_ACCMODE | O_TRUNC); }},
        {"truncate by path", [&] { return errorIf(::truncate(m_other.c_str(), 0) < 0); }},
        {"create a file", [&] { return tryOpen(m_folder / "music/new", O_WRONLY | O_CREAT); }, EACCES},
        {"create a folder", [&] { return errorIf(::mkdir((m_folder / "new").c_str(), 0700) < 0); }, EACCES},
        {"remove a file", [&] { return errorIf(::unlink(m_other.c_str()) < 0); }, EACCES},
        {"rename a file", [&] { return errorIf(::rename(m_other.c_str(), m_medium.c_str()) < 0); }, EACCES},
        {"change a mode", [&] { return errorIf(::chmod(m_other.c_str(), 0777) < 0); }},
        {"change the medium's mode", [&] { return errorIf(::fchmod(medium, 0777) < 0); }},
        {"make a socket", [] { return errorIf(::socket(AF_UNIX, SOCK_STREAM, 0) < 0); }},
        {"make a network socket", [] { return errorIf(::socket(AF_INET, SOCK_STREAM, 0) < 0); }},
        {"execute a program", execute},
        {"fork", [] { return tryCall(SYS_fork); }},
        {"trace the host", [&] { return errorIf(::ptrace(PTRACE_SEIZE, parent, 0, 0) < 0); }},
        {"signal the host", [&] { return errorIf(::kill(parent, 0) < 0); }},
        {"signal a thread of the host", [&] { return tryCall(SYS_tgkill, parent, parent, 0); }},
        {"signal the process group", [] { return errorIf(::kill(0, 0) < 0); }},
        {"signal all processes", [] { return errorIf(::kill(-1, 0) < 0); }},
        {"have the kernel signal the host", [&] { return errorIf(::fcntl(medium, F_SETOWN, parent) < 0); }},
        {"new namespaces", [] { return errorIf(::unshare(CLONE_NEWUSER) < 0); }},
        {"mount", [&] { return errorIf(::mount("none", "/mnt", "tmpfs", 0, nullptr) < 0); }},
        {"type into the terminal", [] { return errorIf(::ioctl(0, TIOCSTI, "x") < 0); }},
        {"the same, with high bits", [] { return tryCall(SYS_ioctl, 0, TIOCSTI | 1ul << 32, "x"); }},
        {"memory files", [] { return errorIf(::memfd_create("x", 0) < 0); }},
        {"calls through a ring", [] { return tryCall(SYS_io_uring_setup, 1, nullptr); }},
        {"raise a limit", [&] { return errorIf(::setrlimit(RLIMIT_NOFILE, &higher) < 0); }},
        {"open with hidden flags", [] { return tryCall(SYS_openat2, -1, nullptr, nullptr, 0); }, ENOSYS},
    };
    for (const auto& test : cases) {
        errno = 0;
        EXPECT_EQ(inside(reading(), test.attempt), test.error) << test.name;
    }
    ::close(medium);
    EXPECT_EQ(readFile(m_medium) + readFile(m_other), "soundsecret");
}

TEST_F(Sandbox, LeavesWhatCodecsNeed) {
    const auto write = [&](const std::filesystem::path& path) { return tryOpen(path, O_WRONLY | O_TRUNC); };
    const auto convertText = [] { return errorIf(::iconv_open("EUC-KR", "UTF-8") == iconv_t(-1)); };
    const auto shareMemory = [] {
        constexpr int kFlags = MAP_SHARED | MAP_ANONYMOUS;
        return errorIf(::mmap(nullptr, 1 << 20, PROT_READ | PROT_WRITE, kFlags, -1, 0) == MAP_FAILED);
    };
    const auto startThread = [] {
        int answer = 1;
        std::thread([&] { answer = 0; }).join();
        return answer;
    };
    const struct {
        const char* name;
        std::function<int()> attempt;
        int result = 0;
    } cases[] = {
        {"read the medium", [&] { return tryOpen(m_medium, O_RDONLY); }},
        {"write the crash log", [&] { return write(m_crashLog); }},
        {"load a library", convertText},
        {"random numbers", [] { return tryOpen("/dev/urandom", O_RDONLY); }},
        {"memory map", [] { return tryOpen("/proc/self/maps", O_RDONLY); }},
        {"list threads", [] { return tryOpen("/proc/self/task", O_RDONLY | O_DIRECTORY); }},
        {"shared memory", shareMemory},
        {"threads", startThread},
        {"discard output", [&] { return write("/dev/null"); }},
        {"signal itself", [] { return errorIf(::raise(SIGTERM)); }, -SIGTERM},
        {"abort", []() -> int { std::abort(); }, -SIGABRT},
    };
    for (const auto& test : cases) EXPECT_EQ(inside(reading(), test.attempt), test.result) << test.name;
}

TEST_F(Sandbox, LetsAFormatReplaceItsTarget) {
    std::filesystem::permissions(m_target, std::filesystem::perms(0640));
    const std::filesystem::path link = m_folder / "music/link.wav";
    std::filesystem::create_symlink("../out/old.wav", link);
    const auto replace = [&] {
        try {
            const auto replacement = peru::getSystem()->startReplacement(toURI(link));
            replacement->getStream()->write("new", 3);
            replacement->commit();
            std::filesystem::remove(m_folder.write("out/removed", "x"));
        } catch (const peru::CException&) {
            return 1;
        }
        return tryOpen(m_other, O_RDONLY) == EACCES ? 0 : 2;
    };
    EXPECT_EQ(inside(slave::allowWriting(link), replace), 0);
    EXPECT_EQ(readFile(m_target), "new");
    EXPECT_EQ(std::filesystem::status(m_target).permissions(), std::filesystem::perms(0640));
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(m_target.parent_path()), {}), 1);
}

TEST_F(Sandbox, GrantsADeviceAndNotItsFolder) {
    const SSandbox sandbox = slave::allowWriting("/dev/full");
    EXPECT_EQ(inside(sandbox, [] { return tryOpen("/dev/full", O_WRONLY); }), 0);
    EXPECT_EQ(inside(sandbox, [] { return tryOpen("/dev/tty", O_WRONLY); }), EACCES);
}

TEST_F(Sandbox, ConfinesThreadsThatAreRunning) {
    const auto countRefusals = [&] {
        std::atomic<bool> confined{false};
        std::atomic<int> refusals{0};
        std::vector<std::thread> threads;
        for (int i = 0; i < 3; ++i)
            threads.emplace_back([&] {
                while (!confined) ::usleep(1000);
                refusals += tryOpen(m_other, O_RDONLY) == EACCES;
                refusals += ::socket(AF_INET, SOCK_STREAM, 0) < 0;
            });
        // Threads that come and go while the others are being confined.
        std::thread starter([&] {
            while (!confined) std::thread([] { ::usleep(100); }).join();
        });
        enterSandbox(reading());
        confined = true;
        starter.join();
        for (std::thread& thread : threads) thread.join();
        return refusals.load();
    };
    EXPECT_EQ(inChild(countRefusals), 6);
}

// As a kernel without Landlock and filters would.
TEST_F(Sandbox, ReportsWhatTheKernelLacks) {
    const auto countLacking = [&] {
        sock_filter code[] = {BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
                              BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_landlock_create_ruleset, 1, 0),
                              BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_seccomp, 0, 1),
                              BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | ENOSYS),
                              BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW)};
        const sock_fprog program{std::size(code), code};
        ::prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0);
        if (::prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) != 0) return kEntryFailed;
        const std::vector<std::string> lacking = enterSandbox(reading());
        rlimit limit{};
        ::getrlimit(RLIMIT_CORE, &limit);
        return static_cast<int>(lacking.size()) + (limit.rlim_max == 0 ? 0 : 100);
    };
    EXPECT_EQ(inChild(countLacking), 2);
}

TEST_F(Sandbox, LimitsMemoryDescriptorsAndCoreDumps) {
    SSandbox sandbox = reading();
    sandbox.memoryLimit = 256 << 20;
    sandbox.fileLimit = 32;
    const auto openAll = [&] {
        int count = 0;
        while (count < 100 && ::open(m_medium.c_str(), O_RDONLY | O_CLOEXEC) >= 0) ++count;
        return count < 32 ? errno : 0;
    };
    EXPECT_EQ(inside(sandbox, openAll), EMFILE);
    const auto getCoreLimit = [] {
        rlimit limit{};
        ::getrlimit(RLIMIT_CORE, &limit);
        return limit.rlim_max == 0 ? 0 : 1;
    };
    EXPECT_EQ(inside(sandbox, getCoreLimit), 0);
#ifndef TONEWRIGHT_SANITIZED
    const auto map = [](size_t size, int kind) {
        const int flags = kind | MAP_ANONYMOUS;
        return errorIf(::mmap(nullptr, size, PROT_READ | PROT_WRITE, flags, -1, 0) == MAP_FAILED);
    };
    for (const int kind : {MAP_PRIVATE, MAP_SHARED}) {
        EXPECT_EQ(inside(sandbox, [&] { return map(128 << 20, kind); }), 0) << kind;
        EXPECT_EQ(inside(sandbox, [&] { return map(257 << 20, kind); }), ENOMEM) << kind;
    }
#endif
}
