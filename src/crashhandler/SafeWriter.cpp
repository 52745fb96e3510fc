#include "crashhandler/SafeWriter.h"

#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

namespace crashhandler {

namespace {

bool writeFully(int file, const char* data, size_t size, int64_t position) {
    while (size > 0) {
        const ssize_t written =
            position < 0 ? ::write(file, data, size) : ::pwrite(file, data, size, position);
        if (written < 0 && errno == EINTR) continue;
        if (written <= 0) return false;
        data += written;
        size -= static_cast<size_t>(written);
        if (position >= 0) position += written;
    }
    return true;
}

// A new file if possible: one that exists may be open elsewhere. Never blocks, and follows no link.
int openPrivate(const char* path) {
    struct stat status;
    if (::lstat(path, &status) == 0 && S_ISREG(status.st_mode)) ::unlink(path);
    const int file = ::open(path, O_WRONLY | O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK, 0600);
    if (file < 0) return -1;
    const bool isUsable = ::fstat(file, &status) == 0 && S_ISREG(status.st_mode) &&
                          status.st_uid == ::geteuid() && ::fchmod(file, 0600) == 0 &&
                          ::ftruncate(file, 0) == 0;
    if (isUsable) return file;
    ::close(file);
    return -1;
}

} // namespace

CSafeWriter::CSafeWriter(const char* path) : m_file(openPrivate(path)) {}

CSafeWriter::~CSafeWriter() {
    if (m_file >= 0) ::close(m_file);
}

void CSafeWriter::fail() {
    ::close(m_file);
    m_file = -1;
}

void CSafeWriter::write(const void* data, size_t size) {
    if (m_file < 0) return;
    m_position += static_cast<uint32_t>(size);
    if (!writeFully(m_file, static_cast<const char*>(data), size, -1)) fail();
}

void CSafeWriter::writeAt(uint32_t position, const void* data, size_t size) {
    if (m_file < 0) return;
    if (!writeFully(m_file, static_cast<const char*>(data), size, position)) fail();
}

void CSafeWriter::writeMemory(uintptr_t address, size_t size) {
    char buffer[4096];
    while (size > 0) {
        // One page at a time, since the next one may not be mapped.
        const size_t wanted = std::min(size, sizeof buffer - address % sizeof buffer);
        const iovec local{buffer, wanted};
        const iovec remote{reinterpret_cast<void*>(address), wanted};
        const ssize_t got = ::process_vm_readv(::getpid(), &local, 1, &remote, 1, 0);
        std::fill(buffer + std::max<ssize_t>(got, 0), buffer + wanted, '\0');
        write(buffer, wanted);
        address += wanted;
        size -= wanted;
    }
}

void CSafeWriter::writeFile(const char* path) {
    const int source = ::open(path, O_RDONLY | O_CLOEXEC);
    if (source < 0) return;
    char buffer[4096];
    for (ssize_t got; (got = ::read(source, buffer, sizeof buffer)) > 0;)
        write(buffer, static_cast<size_t>(got));
    ::close(source);
}

void CSafeWriter::number(uint64_t value, int base) {
    char digits[65];
    char* start = digits + sizeof digits;
    do {
        *--start = "0123456789abcdef"[value % static_cast<unsigned>(base)];
        value /= static_cast<unsigned>(base);
    } while (value > 0);
    write(start, static_cast<size_t>(digits + sizeof digits - start));
}

} // namespace crashhandler
