#include "peru/streams/posix/DiskFile.h"

#include "peru/Errors.h"
#include "peru/streams/StreamTools.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace peru::posix {

namespace {

struct SText {
    const char* key;
    const char* text;
};

constexpr SText kOpenError{"peru.CDiskFile.openError", "The file '%URI%' could not be opened: %ERRORDESC%."};
constexpr SText kKindError{"peru.CDiskFile.kindError", "The file '%URI%' is not a regular file."};
constexpr SText kReadError{"peru.CDiskFile.readError", "The file '%URI%' could not be read: %ERRORDESC%."};
constexpr SText kWriteError{"peru.CDiskFile.writeError",
                            "The file '%URI%' could not be written: %ERRORDESC%."};
constexpr SText kSeekError{"peru.CDiskFile.seekError",
                           "The position in the file '%URI%' could not be changed: %ERRORDESC%."};
constexpr SText kSizeError{"peru.CDiskFile.sizeError",
                           "The size of the file '%URI%' could not be read or changed: %ERRORDESC%."};

[[noreturn]] void raise(const SText& message, int error, const P<IURI>& uri) {
    if (error == EACCES || error == EPERM || error == EROFS) throw CFileAccessDeniedError(uri);
    throw CStreamError(localize(message.key, message.text, {{"%ERRORDESC%", getSystemText(error)}}), uri);
}

int getFlags(EAccess access, EOpenMode mode) {
    int flags = O_CLOEXEC | O_NOCTTY | O_NONBLOCK;
    switch (access) {
    case EAccess::read:
        return flags | O_RDONLY;
    case EAccess::write:
        flags |= O_WRONLY;
        break;
    case EAccess::readWrite:
        flags |= O_RDWR;
        break;
    }
    switch (mode) {
    case EOpenMode::create:
        return flags | O_CREAT | O_TRUNC;
    case EOpenMode::createNew:
        return flags | O_CREAT | O_EXCL;
    case EOpenMode::open:
        return flags;
    case EOpenMode::append:
        return flags | O_CREAT;
    }
    return flags;
}

// Devices may only be written.
bool isAccepted(mode_t kind, EAccess access) {
    return S_ISREG(kind) || (access == EAccess::write && (S_ISCHR(kind) || S_ISBLK(kind)));
}

// Keeps a trailing slash so that the system refuses a URI that names a folder. Empty for an invalid path.
std::string getFilePath(const P<IURI>& uri) {
    std::string path = tryToPath(uri);
    if (path.find('\0') != std::string::npos) return {};
    if (!path.empty() && uri->isDirectory()) path += '/';
    return path;
}

} // namespace

CDiskFile::CDiskFile(const P<IURI>& uri, CFileHandle handle, bool regular)
    : m_uri(uri), m_handle(std::move(handle)), m_regular(regular) {}

CDiskFile::~CDiskFile() {
    try {
        if (m_handle.isOpen()) close();
    } catch (...) {
    }
}

std::unique_ptr<CDiskFile> CDiskFile::tryOpen(const P<IURI>& uri, EAccess access, EOpenMode mode) {
    const std::string path = getFilePath(uri);
    if (path.empty()) return nullptr;
    // Checked before opening: that may block or have side effects on anything but a regular file.
    struct stat info;
    if (::stat(path.c_str(), &info) == 0 && !S_ISDIR(info.st_mode) && !isAccepted(info.st_mode, access))
        raise(kKindError, EINVAL, uri);
    int descriptor;
    do descriptor = ::open(path.c_str(), getFlags(access, mode), 0666);
    while (descriptor < 0 && errno == EINTR);
    if (descriptor < 0) {
        if (errno == ENOENT || errno == ENOTDIR) return nullptr;
        raise(kOpenError, errno, uri);
    }

    CFileHandle handle(descriptor);
    if (::fstat(descriptor, &info) != 0) raise(kOpenError, errno, uri);
    if (S_ISDIR(info.st_mode)) raise(kOpenError, EISDIR, uri);
    if (!isAccepted(info.st_mode, access)) raise(kKindError, EINVAL, uri);
    if (!S_ISREG(info.st_mode)) ::fcntl(descriptor, F_SETFL, ::fcntl(descriptor, F_GETFL) & ~O_NONBLOCK);
    std::unique_ptr<CDiskFile> file(new CDiskFile(uri, std::move(handle), S_ISREG(info.st_mode)));
    if (mode == EOpenMode::append && access != EAccess::read && file->m_regular) file->seek(info.st_size);
    return file;
}

std::unique_ptr<CDiskFile> CDiskFile::open(const P<IURI>& uri, EAccess access, EOpenMode mode) {
    std::unique_ptr<CDiskFile> file = tryOpen(uri, access, mode);
    if (!file) throw CFileNotFoundError(uri);
    return file;
}

std::unique_ptr<CDiskFile> CDiskFile::adopt(const P<IURI>& uri, CFileHandle handle) {
    return std::unique_ptr<CDiskFile>(new CDiskFile(uri, std::move(handle), true));
}

void CDiskFile::checkOpen() const {
    if (!m_handle.isOpen()) throw CStreamClosedError(m_uri);
}

void CDiskFile::close() {
    if (!m_handle.isOpen()) return;
    try {
        if (m_dirty) writeBuffer();
    } catch (...) {
        m_handle.close();
        m_dirty = false;
        throw;
    }
    if (!m_handle.close()) {
        const int error = errno;
        if (error != EINTR) raise(kWriteError, error, m_uri);
    }
}

int64_t CDiskFile::getPosition() const {
    checkOpen();
    return m_bufferStart + m_cursor;
}

void CDiskFile::moveTo(int64_t offset) {
    if (m_fileOffset == offset) return;
    if (::lseek(m_handle.get(), offset, SEEK_SET) < 0) raise(kSeekError, errno, m_uri);
    m_fileOffset = offset;
}

int64_t CDiskFile::readDirect(void* buffer, int64_t size) {
    ssize_t count;
    do count = ::read(m_handle.get(), buffer, static_cast<size_t>(size));
    while (count < 0 && errno == EINTR);
    if (count < 0) raise(kReadError, errno, m_uri);
    m_fileOffset += count;
    return count;
}

int64_t CDiskFile::writeDirect(const void* buffer, int64_t size) {
    const uint8_t* bytes = static_cast<const uint8_t*>(buffer);
    int64_t done = 0;
    while (done < size) {
        const ssize_t count = ::write(m_handle.get(), bytes + done, static_cast<size_t>(size - done));
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) break;
        if (count == 0) {
            errno = EIO;
            break;
        }
        done += count;
    }
    m_fileOffset += done;
    return done;
}

void CDiskFile::writeBuffer() {
    moveTo(m_bufferStart);
    const int64_t done = writeDirect(m_buffer.get(), m_filled);
    const int error = errno;
    const bool complete = done == m_filled;
    std::memmove(m_buffer.get(), m_buffer.get() + done, static_cast<size_t>(m_filled - done));
    m_bufferStart += done;
    m_filled -= done;
    m_cursor -= done;
    if (!complete) raise(kWriteError, error, m_uri);
    m_dirty = false;
}

void CDiskFile::dropBuffer() {
    m_bufferStart += m_cursor;
    m_filled = m_cursor = 0;
}

bool CDiskFile::fill() {
    dropBuffer();
    if (!m_buffer) m_buffer = std::make_unique_for_overwrite<uint8_t[]>(kBufferSize);
    moveTo(m_bufferStart);
    m_filled = readDirect(m_buffer.get(), kBufferSize);
    return m_filled > 0;
}

bool CDiskFile::isAtEnd() {
    checkOpen();
    return getPosition() >= getSize();
}

int64_t CDiskFile::readSome(void* buffer, int64_t size) {
    checkOpen();
    checkStreamSize(size, "IInStream::readSome");
    if (m_dirty) writeBuffer();
    uint8_t* target = static_cast<uint8_t*>(buffer);
    int64_t done = 0;
    while (done < size) {
        if (m_cursor < m_filled) {
            const int64_t count = std::min(size - done, m_filled - m_cursor);
            std::memcpy(target + done, m_buffer.get() + m_cursor, static_cast<size_t>(count));
            m_cursor += count;
            done += count;
        } else if (size - done >= kBufferSize) {
            dropBuffer();
            moveTo(m_bufferStart);
            const int64_t count = readDirect(target + done, size - done);
            if (count == 0) break;
            m_bufferStart += count;
            done += count;
        } else if (!fill()) {
            break;
        }
    }
    return done;
}

void CDiskFile::skip(int64_t size) {
    checkOpen();
    checkStreamSize(size, "IInStream::skip");
    if (size > getSize() - getPosition()) throw CEndOfStreamError(m_uri);
    seek(getPosition() + size);
}

void CDiskFile::write(const void* buffer, int64_t size) {
    checkOpen();
    checkStreamSize(size, "IOutStream::write");
    if (size == 0) return;
    if (!m_dirty) dropBuffer();
    if (m_dirty && m_filled + size > kBufferSize) writeBuffer();
    if (size >= kBufferSize) {
        moveTo(m_bufferStart);
        const int64_t done = writeDirect(buffer, size);
        const int error = errno;
        m_bufferStart += done;
        if (done < size) raise(kWriteError, error, m_uri);
        return;
    }
    if (!m_buffer) m_buffer = std::make_unique_for_overwrite<uint8_t[]>(kBufferSize);
    std::memcpy(m_buffer.get() + m_cursor, buffer, static_cast<size_t>(size));
    m_dirty = true;
    m_cursor += size;
    m_filled = m_cursor;
}

void CDiskFile::flush() {
    checkOpen();
    if (m_dirty) writeBuffer();
    int result;
    do result = ::fdatasync(m_handle.get());
    while (result != 0 && errno == EINTR);
    // Devices cannot be synchronised.
    if (result != 0 && errno != EINVAL && errno != EROFS && errno != ENOTSUP)
        raise(kWriteError, errno, m_uri);
}

void CDiskFile::seek(int64_t position) {
    checkOpen();
    if (position < 0) throw CInvalidArgError("position", "ISeekableStream::seek");
    if (!m_regular && position != getPosition()) raise(kSeekError, ESPIPE, m_uri);
    if (m_dirty) {
        if (position == getPosition()) return;
        writeBuffer();
    }
    if (position >= m_bufferStart && position <= m_bufferStart + m_filled) {
        m_cursor = position - m_bufferStart;
    } else {
        m_bufferStart = position;
        m_filled = m_cursor = 0;
    }
}

int64_t CDiskFile::getSize() const {
    checkOpen();
    struct stat info;
    if (::fstat(m_handle.get(), &info) != 0) raise(kSizeError, errno, m_uri);
    return m_dirty ? std::max<int64_t>(info.st_size, m_bufferStart + m_filled) : info.st_size;
}

void CDiskFile::setSize(int64_t size) {
    checkOpen();
    checkStreamSize(size, "ISeekableOutStream::setSize");
    if (m_dirty) writeBuffer();
    dropBuffer();
    int result;
    do result = ::ftruncate(m_handle.get(), size);
    while (result != 0 && errno == EINTR);
    if (result != 0) raise(kSizeError, errno, m_uri);
}

} // namespace peru::posix
