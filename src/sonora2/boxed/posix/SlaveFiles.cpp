#include "sonora2/boxed/SlaveFiles.h"

#include "peru/system/IPathes.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace sonora2::common {

namespace {

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

std::string createCrashLog(const std::string& folder) {
    constexpr char kSuffix[] = "_log";
    std::string path = folder;
    if (path.empty() || path.back() != '/') path += '/';
    path.append("sonora2_slave_XXXXXX").append(kSuffix);
    const int file = ::mkostemps(path.data(), sizeof kSuffix - 1, O_CLOEXEC);
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
