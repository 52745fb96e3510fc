#include "support/OutputFile.h"

#include "peru/system/ISystem.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstring>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace sonora2::plugins {

namespace {

constexpr peru::SLocalizedText kCreateFailed{"sonora2.plugins.create", "could not create %s: %s"};
constexpr peru::SLocalizedText kWriteFailed{"sonora2.plugins.write", "could not write %s: %s"};

constexpr size_t kBufferSize = 256 * 1024;
constexpr int kMostLinks = 40;

// The path at the end of symbolic links, which need not exist.
std::string followLinks(std::string path) {
    char target[PATH_MAX];
    for (int i = 0; i < kMostLinks; ++i) {
        const ssize_t size = ::readlink(path.c_str(), target, sizeof(target));
        if (size <= 0) break;
        const std::string next(target, static_cast<size_t>(size));
        path = next.front() == '/' ? next : path.substr(0, path.rfind('/') + 1) + next;
    }
    return path;
}

} // namespace

COutputFile::COutputFile(const SMediaFile& file) : m_file(file) {
    constexpr mode_t kMode = 0666; // less the process's mask
    m_buffer.resize(kBufferSize);
    struct stat status {};
    // A link that leads nowhere yet: the new file belongs to its end. Any other is left to the system, since
    // those of open descriptors cannot be read.
    std::string path = file.path;
    if (::stat(path.c_str(), &status) != 0 && errno == ENOENT) path = followLinks(path);
    m_handle = ::open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, kMode);
    if (m_handle >= 0) {
        m_created = path;
        ::flock(m_handle, LOCK_EX | LOCK_NB); // marks the file as being written, for other processes
        ::fstat(m_handle, &status);
        m_identity[0] = status.st_dev;
        m_identity[1] = status.st_ino;
        return;
    }
    if (errno != EEXIST) failSystem(kCreateFailed, file, errno);
    if (::stat(path.c_str(), &status) != 0) failSystem(kCreateFailed, file, errno);
    if (S_ISREG(status.st_mode)) {
        try {
            m_replacement = peru::getSystem()->startReplacement(file.uri);
        } catch (const peru::CException& error) {
            fail(kCreateFailed, file.getDisplayName(), error.getDescription());
        }
        return;
    }
    m_handle = ::open(path.c_str(), O_WRONLY | O_CLOEXEC);
    if (m_handle < 0) failSystem(kCreateFailed, file, errno);
}

COutputFile::~COutputFile() {
    if (m_handle >= 0) ::close(m_handle);
}

void COutputFile::write(const void* data, size_t size) {
    if (!tryWrite(data, size)) throwFailure();
}

void COutputFile::seek(int64_t position) {
    if (!trySeek(position)) throwFailure();
}

int64_t COutputFile::getSize() const {
    return std::max(m_size, tell());
}

void COutputFile::flush() {
    if (!flushBuffer()) throwFailure();
}

void COutputFile::close() {
    flushBuffer();
    // Errors that the system has deferred are reported here at the latest.
    if (const int handle = std::exchange(m_handle, -1); handle >= 0 && ::close(handle) != 0) keepError(errno);
    throwFailure();
    const P<peru::IFileReplacement> replacement = std::move(m_replacement);
    if (!replacement) return;
    try {
        replacement->commit();
    } catch (const peru::CException& error) {
        m_reason = error.getDescription();
        keepError(0);
        throwFailure();
    }
}

bool COutputFile::tryWrite(const void* data, size_t size) noexcept {
    if (m_hasFailed) return false;
    const uint8_t* bytes = static_cast<const uint8_t*>(data);
    if (size > m_buffer.size() - m_fill && !flushBuffer()) return false;
    if (size >= m_buffer.size()) return writeThrough(bytes, size);
    std::memcpy(m_buffer.data() + m_fill, bytes, size);
    m_fill += size;
    return true;
}

bool COutputFile::trySeek(int64_t position) noexcept {
    if (m_hasFailed) return false;
    if (position == tell()) return true;
    if (!flushBuffer()) return false;
    m_position = position;
    return true;
}

void COutputFile::throwFailure() const {
    if (!m_hasFailed) return;
    if (m_reason) fail(kWriteFailed, m_file.getDisplayName(), m_reason);
    failSystem(kWriteFailed, m_file, m_error);
}

void COutputFile::discard() noexcept {
    m_replacement.reset();
    // Not a file that somebody else has put there meanwhile.
    struct stat status {};
    if (!m_created.empty() && ::lstat(m_created.c_str(), &status) == 0 && status.st_dev == m_identity[0] &&
        status.st_ino == m_identity[1])
        ::unlink(m_created.c_str());
    m_created.clear();
    if (const int handle = std::exchange(m_handle, -1); handle >= 0) ::close(handle);
}

bool COutputFile::keepError(int error) noexcept {
    if (!m_hasFailed) m_error = error;
    m_hasFailed = true;
    return false;
}

bool COutputFile::flushBuffer() noexcept {
    if (m_hasFailed) return false;
    const size_t fill = std::exchange(m_fill, 0);
    return fill == 0 || writeThrough(m_buffer.data(), fill);
}

bool COutputFile::writeThrough(const uint8_t* data, size_t size) noexcept {
    if (m_replacement) {
        try {
            const P<peru::ISeekableIOStream> stream = m_replacement->getStream();
            stream->seek(m_position);
            stream->write(data, static_cast<int64_t>(size));
        } catch (const peru::CException& error) {
            m_reason = error.getDescription();
            return keepError(0);
        } catch (...) {
            return keepError(ENOMEM);
        }
        m_position += static_cast<int64_t>(size);
    }
    while (!m_replacement && size > 0) {
        const ssize_t written = ::pwrite(m_handle, data, size, m_position);
        if (written < 0 && errno == EINTR) continue;
        if (written <= 0) return keepError(written < 0 ? errno : EIO);
        data += written;
        size -= static_cast<size_t>(written);
        m_position += written;
    }
    m_size = std::max(m_size, m_position);
    return true;
}

} // namespace sonora2::plugins
