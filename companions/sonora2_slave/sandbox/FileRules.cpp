#include "sonora2_slave/sandbox/FileRules.h"

#include "sonora2_slave/sandbox/EveryThread.h"

#include <cerrno>
#include <fcntl.h>
#include <linux/landlock.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <system_error>
#include <unistd.h>

namespace slave {

namespace {

// Rights that the system's header may be too old for. The version of the interface that introduced them:
constexpr uint64_t kRefer = uint64_t{1} << 13;         // 2
constexpr uint64_t kTruncate = uint64_t{1} << 14;      // 3
constexpr uint64_t kDeviceControl = uint64_t{1} << 15; // 5
constexpr uint64_t kAllNetwork = 3;                    // 4: TCP, bind and connect
constexpr uint64_t kAbstractSockets = 1;               // 6
constexpr uint64_t kSignals = 2;                       // 6

constexpr uint64_t kFirstRights = (uint64_t{1} << 13) - 1; // 1
constexpr uint64_t kReadFile = LANDLOCK_ACCESS_FS_READ_FILE;
constexpr uint64_t kRead = kReadFile | LANDLOCK_ACCESS_FS_READ_DIR;
constexpr uint64_t kWriteFile = kReadFile | LANDLOCK_ACCESS_FS_WRITE_FILE | kTruncate;
constexpr uint64_t kWrite = kRead | kWriteFile | LANDLOCK_ACCESS_FS_MAKE_REG | LANDLOCK_ACCESS_FS_REMOVE_FILE;

// The kernel takes as much of it as it knows.
struct SRuleset {
    uint64_t files = 0;
    uint64_t network = 0;
    uint64_t scopes = 0;
};

constexpr uint32_t kVersion = 1; // LANDLOCK_CREATE_RULESET_VERSION
constexpr uint32_t kErrata = 2;  // LANDLOCK_CREATE_RULESET_ERRATA
constexpr long kSignalErratum = 2;

long createRuleset(const SRuleset* ruleset, size_t size, uint32_t flags) {
    return ::syscall(SYS_landlock_create_ruleset, ruleset, size, flags);
}

SRuleset getHandled(long version, size_t& size) {
    SRuleset ruleset{kFirstRights};
    size = sizeof ruleset.files;
    if (version >= 2) ruleset.files |= kRefer;
    if (version >= 3) ruleset.files |= kTruncate;
    if (version >= 5) ruleset.files |= kDeviceControl;
    if (version >= 4) {
        ruleset.network = kAllNetwork;
        size += sizeof ruleset.network;
    }
    if (version >= 6) {
        ruleset.scopes = kAbstractSockets;
        // With the fault that this bit reports as fixed, threads of one process cannot signal each other. The
        // filter of system calls refuses signals to other processes anyway.
        const long errata = createRuleset(nullptr, 0, kErrata);
        if (errata > 0 && errata & 1 << (kSignalErratum - 1)) ruleset.scopes |= kSignals;
        size += sizeof ruleset.scopes;
    }
    return ruleset;
}

// Runs in a signal handler.
int confineThread(int ruleset) {
    if (::prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0) return errno;
    if (ruleset >= 0 && ::syscall(SYS_landlock_restrict_self, ruleset, 0) != 0) return errno;
    return 0;
}

} // namespace

CFileRules::CFileRules() {
    const long version = createRuleset(nullptr, 0, kVersion);
    if (version < 1) return;
    size_t size = 0;
    const SRuleset ruleset = getHandled(version, size);
    m_handled = ruleset.files;
    m_ruleset = static_cast<int>(createRuleset(&ruleset, size, 0));
    if (m_ruleset < 0) throw std::system_error(errno, std::generic_category(), "landlock_create_ruleset");
}

CFileRules::~CFileRules() {
    if (m_ruleset >= 0) ::close(m_ruleset);
}

void CFileRules::allowReading(const std::filesystem::path& path) {
    allow(path, kRead);
}

void CFileRules::allowWriting(const std::filesystem::path& path) {
    allow(path, kWrite);
}

void CFileRules::allow(const std::filesystem::path& path, uint64_t rights) {
    if (m_ruleset < 0) return;
    const int file = ::open(path.c_str(), O_PATH | O_CLOEXEC);
    if (file < 0) return;
    struct stat status {};
    if (::fstat(file, &status) == 0 && !S_ISDIR(status.st_mode)) rights &= kWriteFile;
    landlock_path_beneath_attr rule{};
    rule.allowed_access = rights & m_handled;
    rule.parent_fd = file;
    const long result = ::syscall(SYS_landlock_add_rule, m_ruleset, LANDLOCK_RULE_PATH_BENEATH, &rule, 0);
    const int error = errno;
    ::close(file);
    // Objects without a place in a file system, such as the pipe behind /dev/stdin, cannot be in a rule and
    // do not need one once they are open.
    if (result != 0 && error != EBADFD)
        throw std::system_error(error, std::generic_category(), "landlock_add_rule: " + path.string());
}

bool CFileRules::enforce() {
    runOnEveryThread(confineThread, m_ruleset);
    return m_ruleset >= 0;
}

} // namespace slave
