#include "sonora2/boxed/SlaveFiles.h"

#include "peru/system/IPathes.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <fcntl.h>
#include <filesystem>
#include <mutex>
#include <set>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace sonora2::common {

namespace {

constexpr const char* kPrefix = "sonora2_slave_";
constexpr const char* kSuffix = "_log";
constexpr int kMostLinks = 40;

// The path at the end of symbolic links, which need not exist.
std::string followLinks(std::string path) {
    char target[PATH_MAX];
    for (int i = 0; i < kMostLinks; ++i) {
        const ssize_t size = ::readlink(path.c_str(), target, sizeof target);
        if (size <= 0) break;
        const std::string next(target, static_cast<size_t>(size));
        path = next.front() == '/' ? next : path.substr(0, path.rfind('/') + 1) + next;
    }
    return path;
}

} // namespace

void removeStaleCrashLogs(const std::string& folder) noexcept {
    constexpr time_t kLongEnough = 60; // seconds until a slave has locked its file
    std::error_code error;
    // The increment of a range-based loop would throw.
    for (std::filesystem::directory_iterator entry(folder, error), end; !error && entry != end;
         entry.increment(error)) {
        const std::string name = entry->path().filename().string();
        if (!name.starts_with(kPrefix) || !name.ends_with(kSuffix)) continue;
        const int file = ::open(entry->path().c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK);
        if (file < 0) continue;
        struct stat status {};
        if (::fstat(file, &status) == 0 && S_ISREG(status.st_mode) && status.st_uid == ::geteuid() &&
            status.st_size == 0 && std::time(nullptr) - status.st_mtime > kLongEnough &&
            ::flock(file, LOCK_EX | LOCK_NB) == 0)
            ::unlink(entry->path().c_str());
        ::close(file);
    }
}

std::string createCrashLog(const std::string& folder) {
    {
        static std::mutex s_mutex;
        static std::set<std::string> s_cleaned;
        const std::scoped_lock lock(s_mutex);
        if (s_cleaned.insert(folder).second) removeStaleCrashLogs(folder);
    }
    std::string path = folder;
    if (path.empty() || path.back() != '/') path += '/';
    path.append(kPrefix).append("XXXXXX").append(kSuffix);
    const int file = ::mkostemps(path.data(), static_cast<int>(std::strlen(kSuffix)), O_CLOEXEC);
    if (file < 0) return {};
    ::close(file);
    return path;
}

void CUnfinishedOutput::expect(const P<peru::IURI>& target) {
    m_isKnown = false;
    m_path = followLinks(peru::CString::toStdString(peru::getPathes()->toPlatformPath(target)));
    struct stat status {};
    if (m_path.empty() || ::lstat(m_path.c_str(), &status) == 0 || errno != ENOENT) m_path.clear();
}

void CUnfinishedOutput::opened() {
    struct stat status {};
    m_isKnown = !m_path.empty() && ::lstat(m_path.c_str(), &status) == 0;
    m_identity[0] = status.st_dev;
    m_identity[1] = status.st_ino;
}

void CUnfinishedOutput::remove() noexcept {
    struct stat status {};
    if (m_path.empty() || ::lstat(m_path.c_str(), &status) != 0 || !S_ISREG(status.st_mode)) return;
    // A slave that has died while it opened the file has not reported it.
    const bool isOwn = !m_isKnown || (status.st_dev == m_identity[0] && status.st_ino == m_identity[1]);
    if (isOwn) ::unlink(m_path.c_str());
    m_path.clear();
}

} // namespace sonora2::common
