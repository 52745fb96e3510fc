#include "OutputPlace.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <climits>
#include <cstring>
#include <fcntl.h>
#include <stdexcept>
#include <sys/stat.h>
#include <unistd.h>

namespace host {

namespace fs = std::filesystem;

namespace {

[[noreturn]] void throwSystem(int error) {
    throw std::runtime_error(std::strerror(error));
}

// A name at the limit of the file system is cut before its extension, which selects the format, and stays
// unique by a number.
fs::path nameTemporary(const fs::path& target, const std::string& ending) {
    static std::atomic<unsigned> s_count{0};
    const std::string name = target.filename(), extension = target.extension();
    if (name.size() + ending.size() <= NAME_MAX) return target.native() + ending;
    const std::string end = "~" + std::to_string(++s_count) + extension + ending;
    return target.parent_path() / (name.substr(0, NAME_MAX - std::min<size_t>(end.size(), NAME_MAX)) + end);
}

} // namespace

COutputPlace::COutputPlace(const fs::path& target, const std::string& temporaryEnding, bool replace)
    : m_target(target), m_replace(replace) {
    // The other name in a message is the input's, so that this one has to be told.
    const auto refuse = [&](const std::string& reason) {
        throw std::runtime_error(target.string() + " cannot be written: " + reason);
    };
    std::error_code error;
    if (fs::is_symlink(m_target, error)) {
        const fs::path meant = fs::weakly_canonical(m_target, error);
        if (!error) m_target = meant;
    }
    struct stat status;
    if (::stat(m_target.c_str(), &status) == 0) {
        if (S_ISDIR(status.st_mode)) refuse(std::strerror(EISDIR));
        if (!S_ISREG(status.st_mode)) refuse("Is not a regular file");
        if (!replace) throw std::runtime_error(target.string() + " exists (--force replaces it)");
    } else if (errno != ENOENT) {
        refuse(std::strerror(errno));
    }
    const fs::path folder = m_target.has_parent_path() ? m_target.parent_path() : fs::path(".");
    if (::stat(folder.c_str(), &status) != 0)
        throw std::runtime_error("The folder " + folder.string() + " does not exist");
    if (!S_ISDIR(status.st_mode)) throw std::runtime_error(folder.string() + " is no folder");
    if (::access(folder.c_str(), W_OK | X_OK) != 0)
        throw std::runtime_error("The folder " + folder.string() +
                                 " cannot be written to: " + std::strerror(errno));
    m_temporary = nameTemporary(m_target, temporaryEnding);
    if (!replace && ::lstat(m_temporary.c_str(), &status) == 0)
        throw std::runtime_error(m_temporary.string() + " was left by an earlier run (--force replaces it)");
}

COutputPlace::~COutputPlace() {
    if (!m_committed) ::unlink(m_temporary.c_str());
}

void COutputPlace::commit() {
    const int file = ::open(m_temporary.c_str(), O_RDONLY | O_CLOEXEC);
    if (file < 0) throwSystem(errno);
    struct stat status;
    if (m_replace && ::stat(m_target.c_str(), &status) == 0) {
        // Best effort: the folder is ours, the file may have been another user's.
        if (::fchown(file, status.st_uid, status.st_gid) != 0) errno = 0;
        ::fchmod(file, status.st_mode & 07777);
    }
    int error = ::fsync(file) == 0 ? 0 : errno;
    ::close(file);
    if (error == 0) {
        // Without --force a file that has come into being meanwhile is not replaced either.
        if (::renameat2(AT_FDCWD, m_temporary.c_str(), AT_FDCWD, m_target.c_str(),
                        m_replace ? 0 : RENAME_NOREPLACE) != 0) {
            error = errno;
            if (error == EINVAL && !m_replace) // a file system without that flag
                error = ::link(m_temporary.c_str(), m_target.c_str()) == 0 ? ::unlink(m_temporary.c_str())
                                                                           : errno;
        }
    }
    if (error != 0) throwSystem(error);
    m_committed = true;
}

} // namespace host
