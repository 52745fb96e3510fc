#include "sonora2_slave/sandbox/SystemCallFilter.h"

#include <cerrno>
#include <fcntl.h>
#include <initializer_list>
#include <linux/fs.h>
#include <memory>
#include <sched.h>
#include <seccomp.h>
#include <string>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <system_error>
#include <unistd.h>
#include <vector>

namespace slave {

namespace {

constexpr const char* kRefused[] = {
    // Programs and processes
    "execve", "execveat", "fork", "vfork",
    // Connections; the one to the host exists
    "socket", "socketpair", "connect", "bind", "listen", "accept", "accept4",
    // Other processes; tkill does not say which process a thread belongs to
    "ptrace", "process_vm_writev", "process_madvise", "process_mrelease", "kcmp", "pidfd_open", "pidfd_getfd",
    "pidfd_send_signal", "tkill", "migrate_pages", "move_pages", "setpriority", "sched_setaffinity",
    "sched_setattr", "sched_setparam", "sched_setscheduler", "ioprio_set",
    // Namespaces and mounts
    "mount", "umount", "umount2", "pivot_root", "chroot", "unshare", "setns", "open_tree", "open_tree_attr",
    "move_mount", "fsopen", "fsconfig", "fsmount", "fspick", "mount_setattr",
    // Ways around the checks of paths and of system calls
    "open_by_handle_at", "name_to_handle_at", "io_uring_setup", "io_uring_enter", "io_uring_register",
    "userfaultfd", "uselib", "fanotify_init", "fanotify_mark", "inotify_init", "inotify_init1",
    // Attributes of files, which Landlock does not protect
    "chmod", "fchmodat", "fchmodat2", "chown", "lchown", "fchownat", "utime", "utimes", "futimesat",
    "setxattr", "lsetxattr", "setxattrat", "removexattr", "lremovexattr", "removexattrat", "truncate",
    "file_setattr",
    // Objects that outlive the process or that no limit counts
    "shmget", "shmat", "shmctl", "msgget", "msgsnd", "msgrcv", "msgctl", "semget", "semop", "semtimedop",
    "semctl", "mq_open", "mq_unlink", "memfd_create", "memfd_secret",
    // Identity and limits
    "setuid", "setgid", "setreuid", "setregid", "setresuid", "setresgid", "setgroups", "setfsuid", "setfsgid",
    "capset", "setrlimit", "personality", "add_key", "request_key", "keyctl",
    // The machine
    "bpf", "perf_event_open", "kexec_load", "kexec_file_load", "init_module", "finit_module", "delete_module",
    "reboot", "swapon", "swapoff", "syslog", "acct", "quotactl", "quotactl_fd", "iopl", "ioperm",
    "settimeofday", "clock_settime", "clock_adjtime", "adjtimex", "sethostname", "setdomainname", "vhangup",
    "lookup_dcookie"};

// Attributes through an open file, which may have been opened for reading only.
constexpr const char* kRefusedWhereNothingIsMade[] = {"fchmod", "fchown", "fsetxattr", "fremovexattr"};

// The kernel looks at the lower half of these arguments only.
constexpr scmp_datum_t kInt = 0xffffffff;

// The library's macros for these are C.
scmp_arg_cmp differs(unsigned argument, scmp_datum_t value) {
    return {argument, SCMP_CMP_NE, value, 0};
}
scmp_arg_cmp isEqual(unsigned argument, scmp_datum_t mask, scmp_datum_t value) {
    return {argument, SCMP_CMP_MASKED_EQ, mask, value};
}

class CFilter {
public:
    CFilter() : m_context(::seccomp_init(SCMP_ACT_ALLOW), &::seccomp_release) {
        if (!m_context) throw std::bad_alloc();
        set(SCMP_FLTATR_ACT_BADARCH, SCMP_ACT_ERRNO(EPERM)); // calls with the numbers of another architecture
        set(SCMP_FLTATR_API_SYSRAWRC, 1);                    // the kernel's own error codes
        m_hasThreads = ::seccomp_attr_set(m_context.get(), SCMP_FLTATR_CTL_TSYNC, 1) == 0;
        // A search tree instead of a list. Older versions of the library lack it.
        static_cast<void>(::seccomp_attr_set(m_context.get(), SCMP_FLTATR_CTL_OPTIMIZE, 2));
    }

    // Calls that the library or this architecture does not have are skipped.
    void refuse(const char* name, std::initializer_list<scmp_arg_cmp> conditions = {}, int error = EPERM) {
        const int number = ::seccomp_syscall_resolve_name(name);
        if (number < 0) return;
        check(::seccomp_rule_add_array(m_context.get(), SCMP_ACT_ERRNO(static_cast<uint16_t>(error)), number,
                                       static_cast<unsigned>(conditions.size()), conditions.begin()),
              name);
    }

    // False if the kernel has no filters, or none for all threads at once.
    bool load() {
        if (!m_hasThreads) return false;
        const int result = ::seccomp_load(m_context.get());
        if (result == -EINVAL || result == -ENOSYS || result == -EOPNOTSUPP) return false;
        check(result, "seccomp_load");
        return true;
    }

private:
    static void check(int result, const char* what) {
        if (result != 0) throw std::system_error(-result, std::generic_category(), what);
    }
    void set(scmp_filter_attr attribute, uint32_t value) {
        check(::seccomp_attr_set(m_context.get(), attribute, value), "seccomp_attr_set");
    }

    std::unique_ptr<void, decltype(&::seccomp_release)> m_context;
    bool m_hasThreads = false;
};

// Threads of this process are the only ones that may be made, and signals go to this process only.
void refuseOtherProcesses(CFilter& filter) {
    const auto self = static_cast<scmp_datum_t>(::getpid());
    for (const char* call : {"kill", "tgkill", "rt_sigqueueinfo", "rt_tgsigqueueinfo", "process_vm_readv"})
        filter.refuse(call, {differs(0, self)});
    filter.refuse("clone", {isEqual(0, CLONE_THREAD, 0)});
    for (const scmp_datum_t flag : {CLONE_NEWNS, CLONE_NEWCGROUP, CLONE_NEWUTS, CLONE_NEWIPC, CLONE_NEWUSER,
                                    CLONE_NEWPID, CLONE_NEWNET})
        filter.refuse("clone", {isEqual(0, flag, flag)});
    // Its flags are in memory, where the filter cannot see them. The C library falls back to clone.
    filter.refuse("clone3", {}, ENOSYS);
    filter.refuse("prlimit64", {differs(2, 0)});
    // Signals that the kernel sends when data arrives.
    for (const scmp_datum_t command : {F_SETOWN, F_SETOWN_EX, F_SETSIG})
        filter.refuse("fcntl", {isEqual(1, kInt, command)});
}

void refuseRequests(CFilter& filter) {
    constexpr scmp_datum_t kTypeIntoTerminal = TIOCSTI, kTerminalMenu = TIOCLINUX, kOwner = FIOSETOWN,
                           kGroup = SIOCSPGRP, kFlags = FS_IOC_SETFLAGS, kExtended = FS_IOC_FSSETXATTR;
    for (const scmp_datum_t request : {kTypeIntoTerminal, kTerminalMenu, kOwner, kGroup, kFlags, kExtended})
        filter.refuse("ioctl", {isEqual(1, kInt, request)});
}

// Before version 3 Landlock does not check truncation, which does not need write access.
void refuseTruncation(CFilter& filter) {
    const auto refuse = [&](scmp_datum_t mask, scmp_datum_t value) {
        filter.refuse("open", {isEqual(1, mask, value)});
        filter.refuse("openat", {isEqual(2, mask, value)});
    };
    refuse(O_ACCMODE | O_TRUNC, O_RDONLY | O_TRUNC);
    refuse(O_ACCMODE, O_ACCMODE); // neither reading nor writing, for requests to devices
    filter.refuse("openat2", {}, ENOSYS);
}

} // namespace

bool filterSystemCalls(bool makesFiles) {
    CFilter filter;
    for (const char* call : kRefused) filter.refuse(call);
    refuseOtherProcesses(filter);
    refuseRequests(filter);
    refuseTruncation(filter);
    if (makesFiles) {
        filter.refuse("utimensat", {differs(1, 0)}); // by path
    } else {
        for (const char* call : kRefusedWhereNothingIsMade) filter.refuse(call);
        filter.refuse("utimensat");
    }
    return filter.load();
}

} // namespace slave
