#include "writing/StagedFiles.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

namespace discio {

namespace fs = std::filesystem;

namespace {

constexpr int64_t kWriteBehind = 8 << 20; // bytes

[[noreturn]] void fail(const std::string& path, int error) {
    const bool isFull = error == ENOSPC || error == EDQUOT || error == EFBIG;
    throw CDiscError(isFull ? DISCIO_ERROR_NOT_ENOUGH_SPACE : DISCIO_ERROR_CANNOT_WRITE,
                     path + ": " + std::generic_category().message(error));
}

} // namespace

CStagedFiles::CStagedFiles(const std::string& target) {
    if (!target.starts_with('/'))
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, target + " is not an absolute path");
    fs::path path = target;
    std::error_code error;
    if (fs::is_symlink(path, error)) {
        path = fs::weakly_canonical(path, error);
        if (error) fail(target, error.value());
    }
    struct stat status {};
    if (::stat(path.c_str(), &status) == 0) {
        if (!S_ISREG(status.st_mode))
            throw CDiscError(DISCIO_ERROR_NOT_A_FILE, target + " is not a regular file");
        if (::access(path.c_str(), W_OK) != 0) fail(target, errno);
    }
    m_name = path.filename();
    m_parent = path.parent_path();
    m_folder = m_parent + "/.discio-XXXXXX";
    if (!::mkdtemp(m_folder.data())) fail(target, errno);
}

CStagedFiles::~CStagedFiles() {
    std::error_code none;
    fs::remove_all(m_folder, none);
}

void CStagedFiles::move(const std::string& name) const {
    const std::string from = getPath(name), to = m_parent + "/" + name;
    struct stat status {};
    if (::lstat(to.c_str(), &status) == 0) {
        if (S_ISDIR(status.st_mode)) fail(to, EISDIR);
        if (S_ISREG(status.st_mode)) ::chmod(from.c_str(), status.st_mode & 07777);
        if (::renameat2(AT_FDCWD, from.c_str(), AT_FDCWD, to.c_str(), RENAME_EXCHANGE) == 0) return;
        // Not every file system can exchange, or has hard links.
        if (errno != EINVAL && errno != ENOSYS) fail(to, errno);
        if (::link(to.c_str(), getOldPath(name).c_str()) != 0 &&
            ::rename(to.c_str(), getOldPath(name).c_str()) != 0)
            fail(to, errno);
    }
    if (::rename(from.c_str(), to.c_str()) == 0) return;
    const int error = errno;
    std::rename(getOldPath(name).c_str(), to.c_str());
    fail(to, error);
}

void CStagedFiles::moveBack(const std::string& name) const noexcept {
    const std::string staged = getPath(name), placed = m_parent + "/" + name;
    if (::renameat2(AT_FDCWD, staged.c_str(), AT_FDCWD, placed.c_str(), RENAME_EXCHANGE) == 0) return;
    std::rename(placed.c_str(), staged.c_str());
    std::rename(getOldPath(name).c_str(), placed.c_str());
}

void CStagedFiles::commit(const std::vector<std::string>& names) {
    size_t moved = 0;
    try {
        for (; moved < names.size(); ++moved) move(names[moved]);
    } catch (const CDiscError&) {
        while (moved-- > 0) moveBack(names[moved]);
        throw;
    }
    // The names are flushed as well; a file system that cannot do that has done it already.
    const int folder = ::open(m_parent.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (folder < 0) return;
    ::fsync(folder);
    ::close(folder);
}

CNewFile::CNewFile(const std::string& path)
    : m_path(path), m_file(::open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666)) {
    if (m_file < 0) fail();
}

CNewFile::~CNewFile() {
    ::close(m_file);
}

void CNewFile::fail() const {
    discio::fail(m_path, errno);
}

void CNewFile::write(const void* data, size_t size) {
    const char* from = static_cast<const char*>(data);
    while (size > 0) {
        const ssize_t count = ::pwrite(m_file, from, size, static_cast<off_t>(m_size));
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) fail();
        from += count;
        size -= static_cast<size_t>(count);
        m_size += count;
        if (m_size - m_started < kWriteBehind) continue;
        // The disk starts now instead of with the flush at the end.
        ::sync_file_range(m_file, static_cast<off_t>(m_started), static_cast<off_t>(m_size - m_started),
                          SYNC_FILE_RANGE_WRITE);
        m_started = m_size;
    }
}

void CNewFile::finish() {
    if (::ftruncate(m_file, static_cast<off_t>(m_size)) != 0 || ::fsync(m_file) != 0) fail();
    ::posix_fadvise(m_file, 0, 0, POSIX_FADV_DONTNEED); // what the disk holds counts, not the memory
}

} // namespace discio
