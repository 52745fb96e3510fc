#include "support/OutputFile.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace sonora2::plugins {

namespace {

constexpr size_t kBufferSize = 256 * 1024;

} // namespace

COutputFile::COutputFile(const SMediaFile& file) : m_file(file) {
    constexpr mode_t kMode = 0666; // less the process's mask
    m_handle = ::open(file.path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, kMode);
    m_made = m_handle >= 0;
    if (!m_made && errno == EEXIST)
        m_handle = ::open(file.path.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, kMode);
    if (m_handle < 0) failSystem("could not create", file, errno);
    m_buffer.resize(kBufferSize);
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

void COutputFile::commit() {
    if (truncateOnce() != 0) throwFailure();
}

void COutputFile::flush() {
    if (flushBuffer() != 0) throwFailure();
}

void COutputFile::close() {
    if (m_handle < 0) return throwFailure();
    flushBuffer();
    // What the system could not store is told here at the latest.
    if (::close(m_handle) != 0 && m_error == 0) m_error = errno;
    m_handle = -1;
    throwFailure();
}

bool COutputFile::tryWrite(const void* data, size_t size) noexcept {
    if (m_error != 0) return false;
    const uint8_t* bytes = static_cast<const uint8_t*>(data);
    if (size > m_buffer.size() - m_fill && flushBuffer() != 0) return false;
    if (size >= m_buffer.size()) return writeThrough(bytes, size) == 0;
    std::memcpy(m_buffer.data() + m_fill, bytes, size);
    m_fill += size;
    return true;
}

bool COutputFile::trySeek(int64_t position) noexcept {
    if (m_error != 0) return false;
    if (position == tell()) return true;
    if (flushBuffer() != 0) return false;
    m_position = position;
    return true;
}

void COutputFile::throwFailure() const {
    if (m_error != 0) failSystem("could not write", m_file, m_error);
}

void COutputFile::discard() noexcept {
    if (m_handle < 0) return;
    ::close(m_handle);
    m_handle = -1;
    if (m_made) ::unlink(m_file.path.c_str());
}

int COutputFile::flushBuffer() noexcept {
    if (m_fill == 0 || m_error != 0) return m_error;
    const size_t fill = std::exchange(m_fill, 0);
    return writeThrough(m_buffer.data(), fill);
}

int COutputFile::writeThrough(const uint8_t* data, size_t size) noexcept {
    if (truncateOnce() != 0) return m_error;
    while (size > 0) {
        const ssize_t written = ::pwrite(m_handle, data, size, m_position);
        if (written < 0 && errno == EINTR) continue;
        if (written <= 0) return m_error = written < 0 ? errno : EIO;
        data += written;
        size -= static_cast<size_t>(written);
        m_position += written;
        m_size = std::max(m_size, m_position);
    }
    return 0;
}

int COutputFile::truncateOnce() noexcept {
    if (m_truncated) return m_error;
    struct stat status {};
    // Devices have no length to cut.
    const bool regular = ::fstat(m_handle, &status) == 0 && S_ISREG(status.st_mode);
    if (regular && status.st_size > 0 && ::ftruncate(m_handle, 0) != 0) return m_error = errno;
    m_truncated = true;
    return 0;
}

} // namespace sonora2::plugins
