#include "peru/files/posix/FileReplacement.h"

#include "peru/Errors.h"
#include "peru/files/posix/FileAttributes.h"
#include "peru/files/posix/FileOperations.h"
#include "peru/streams/posix/DiskStreams.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace peru::posix {
namespace {

[[noreturn]] void raise(int error, const P<IURI>& file) {
    if (error == EACCES || error == EPERM || error == EROFS) throw CFileAccessDeniedError(file);
    if (error == ENOENT) throw CFileNotFoundError(file);
    throw CFileError(localize("peru.CSystem.ReplaceFileFailed", "Error writing file '%FILE%' (%MSG%).",
                              {{"%FILE%", getShownName(file)}, {"%MSG%", getSystemText(error)}}),
                     file);
}

// Resolves links, also a dangling one, whose target is the file to be created. Empty on failure, with errno
// set.
std::string followLinks(std::string path) {
    constexpr int kMostLinks = 40; // as many as the kernel follows
    for (int i = 0; i < kMostLinks; ++i) {
        std::unique_ptr<char, decltype(&std::free)> real(::realpath(path.c_str(), nullptr), &std::free);
        if (real) return real.get();
        if (errno != ENOENT) return "";
        std::string target(PATH_MAX, '\0');
        const ssize_t length = ::readlink(path.c_str(), target.data(), target.size());
        if (length < 0) return path; // the file does not exist
        target.resize(static_cast<size_t>(length));
        path = target.starts_with('/') ? target : path.substr(0, path.rfind('/') + 1) + target;
    }
    errno = ELOOP;
    return "";
}

// The mode of an ordinary new file in the folder, as decided by the umask and a default access list.
mode_t getNewFileMode(const std::string& folder) {
    struct stat status = {};
    int error = 0;
    const std::string path = createUnique(folder, ".new-", "", error, [&](const std::string& name) {
        const CFileHandle file(::open(name.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666));
        return file.isOpen() && ::fstat(file.get(), &status) == 0 ? 0 : errno;
    });
    if (path.empty()) return 0600;
    ::unlink(path.c_str());
    return status.st_mode & 0777;
}

// A path to a file that has no name. Without /proc an ordinary user has no other way to link such a file.
std::string getDescriptorPath(int file) {
    return "/proc/self/fd/" + std::to_string(file);
}

// Otherwise the directory may still hold the old entry after a power failure. Failure is ignored: there is no
// other way.
void syncFolder(const std::string& path) {
    const CFileHandle folder(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.isOpen()) ::fsync(folder.get());
}

// The first range with data between `start` and `end`; the whole range if the file system does not report
// holes.
struct SStretch {
    int64_t start;
    int64_t end;
};
SStretch findData(int file, int64_t start, int64_t end) {
    const off_t data = ::lseek(file, start, SEEK_DATA);
    if (data < 0 && errno != ENXIO) return {start, end};
    if (data < 0 || data >= end) return {end, end};
    const off_t hole = ::lseek(file, data, SEEK_HOLE);
    return {data, hole < 0 ? end : std::min<int64_t>(hole, end)};
}

} // namespace

// Turns stream errors into file errors, so that callers need to catch only one kind.
class CReplacementStream : public CDiskIOStream {
public:
    CReplacementStream(const P<IURI>& file, CFileHandle handle)
        : CDiskIOStream(CDiskFile::adopt(file, std::move(handle))) {}

    void read(void* buffer, int64_t size) override {
        call([&] { CDiskIOStream::read(buffer, size); });
    }
    int64_t readSome(void* buffer, int64_t size) override {
        return call([&] { return CDiskIOStream::readSome(buffer, size); });
    }
    void write(const void* buffer, int64_t size) override {
        call([&] { CDiskIOStream::write(buffer, size); });
    }
    void skip(int64_t size) override {
        call([&] { CDiskIOStream::skip(size); });
    }
    void seek(int64_t position) override {
        call([&] { CDiskIOStream::seek(position); });
    }
    void flush() override {
        call([&] { CDiskIOStream::flush(); });
    }
    void setSize(int64_t size) override {
        call([&] { CDiskIOStream::setSize(size); });
    }
    void close() override {
        call([&] { CDiskIOStream::close(); });
    }

private:
    template <class Operation> auto call(Operation operation) -> decltype(operation()) {
        try {
            return operation();
        } catch (const CEndOfStreamError&) {
            throw;
        } catch (const CStreamError& error) {
            throw CFileError(error.getDescription(), getURI());
        }
    }
};

STemporaryName::~STemporaryName() {
    if (!path.empty()) ::unlink(path.c_str());
}

CFileReplacement::CFileReplacement(const P<IURI>& file) : m_uri(file) {
    m_target = followLinks(toPath(file));
    if (m_target.empty()) raise(errno, file);
    if (m_target.find('/') == std::string::npos) m_target.insert(0, "./");
    m_folder = m_target.substr(0, m_target.rfind('/') + 1);
    openOld();
    openNew();
    CFileHandle own(::fcntl(m_new.get(), F_DUPFD_CLOEXEC, 0));
    if (!own.isOpen()) raise(errno, file);
    m_stream = make<CReplacementStream>(file, std::move(own));
}

CFileReplacement::~CFileReplacement() = default;

void CFileReplacement::openOld() {
    struct stat status;
    // Checked before opening: opening a FIFO may block, and opening some devices has side effects.
    if (::stat(m_target.c_str(), &status) != 0) {
        if (errno == ENOENT) return;
        raise(errno, m_uri);
    }
    if (S_ISDIR(status.st_mode)) raise(EISDIR, m_uri);
    if (!S_ISREG(status.st_mode)) raise(EINVAL, m_uri);
    // Renaming over a file needs no permission to write it, so check that here.
    if (::faccessat(AT_FDCWD, m_target.c_str(), W_OK, AT_EACCESS) != 0) raise(errno, m_uri);
    m_old = CFileHandle(::open(m_target.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
    if (!m_old.isOpen()) raise(errno, m_uri);
}

void CFileReplacement::openNew() {
    // Nobody can open the unnamed file, so it may have its final mode from the start.
    const mode_t mode = m_old.isOpen() ? 0600 : 0666;
    m_new = CFileHandle(::open(m_folder.c_str(), O_TMPFILE | O_RDWR | O_CLOEXEC, mode));
    if (m_new.isOpen() && ::access(getDescriptorPath(m_new.get()).c_str(), F_OK) == 0) return;
    if (!m_new.isOpen() && errno != EOPNOTSUPP && errno != EISDIR && errno != EINVAL && errno != ENOENT)
        raise(errno, m_uri);
    if (int error = openNamed(m_new)) raise(error, m_uri);
}

int CFileReplacement::openNamed(CFileHandle& file) {
    int error = 0;
    m_name.path = createUnique(m_folder, ".new-", "", error, [&](const std::string& name) {
        file = CFileHandle(::open(name.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
        return file.isOpen() ? 0 : errno;
    });
    return error;
}

P<ISeekableIOStream> CFileReplacement::getStream() {
    return m_stream;
}

void CFileReplacement::copyFromOld(int64_t offset, int64_t size) {
    const int64_t position = m_stream->getPosition();
    const int64_t end = offset + size;
    // Past its end the new file reads as zeros, so holes of the old one can stay holes.
    const bool mayHaveHoles = position >= m_stream->getSize();
    // Also flushes the stream's buffer to the file and discards its read-ahead.
    m_stream->setSize(std::max(m_stream->getSize(), position + size));
    struct stat status;
    if (::fstat(m_old.get(), &status) != 0) raise(errno, m_uri);
    bool isLongEnough = status.st_size >= end;
    for (int64_t at = offset; isLongEnough && at < end;) {
        const SStretch data = mayHaveHoles ? findData(m_old.get(), at, end) : SStretch{at, end};
        int64_t copied = 0;
        if (const int error = copyRange(m_old.get(), data.start, m_new.get(), position + data.start - offset,
                                        data.end - data.start, copied))
            raise(error, m_uri);
        isLongEnough = copied == data.end - data.start;
        at = data.end;
    }
    if (!isLongEnough)
        throw CFileError(localize("peru.CFileReplacement.FileTooShort",
                                  "The file '%FILE%' has become shorter.", {{"%FILE%", getShownName(m_uri)}}),
                         m_uri);
    m_stream->seek(position + size);
}

int CFileReplacement::giveName() {
    int error = 0;
    const std::string descriptor = getDescriptorPath(m_new.get());
    m_name.path = createUnique(m_folder, ".new-", "", error, [&](const std::string& beside) {
        return ::linkat(AT_FDCWD, descriptor.c_str(), AT_FDCWD, beside.c_str(), AT_SYMLINK_FOLLOW) == 0
                   ? 0
                   : errno;
    });
    return error;
}

int CFileReplacement::copyToNamed() {
    CFileHandle named;
    struct stat status;
    if (::fstat(m_new.get(), &status) != 0) return errno;
    if (int error = openNamed(named)) return error;
    int64_t copied = 0;
    if (int error = copyRange(m_new.get(), 0, named.get(), 0, status.st_size, copied)) return error;
    if (copied != status.st_size) return EIO;
    m_new = std::move(named);
    return finishContent();
}

int CFileReplacement::finishContent() {
    if (m_old.isOpen()) {
        if (int error = takeOverAttributes(m_old.get(), m_new.get())) return error;
    } else if (!m_name.path.empty()) {
        // File systems without modes refuse to set one.
        static_cast<void>(::fchmod(m_new.get(), getNewFileMode(m_folder)));
    }
    return ::fsync(m_new.get()) == 0 ? 0 : errno;
}

int CFileReplacement::finish() {
    if (int error = finishContent()) return error;
    // A file system without hard links cannot name the unnamed file; its content must not be lost for that.
    if (m_name.path.empty() && giveName() != 0)
        if (int error = copyToNamed()) return error;
    if (::rename(m_name.path.c_str(), m_target.c_str()) != 0) return errno;
    m_name.path.clear();
    return 0;
}

void CFileReplacement::commit() {
    m_stream->close();
    if (int error = finish()) raise(error, m_uri);
    syncFolder(m_folder);
}

} // namespace peru::posix
