#include "peru/posix/FileOperations.h"

#include <cerrno>
#include <cstdio>
#include <fcntl.h>
#include <memory>
#include <sys/stat.h>
#include <unistd.h>

namespace peru::posix {
namespace {

constexpr size_t kBufferSize = 256 * 1024;
// What one call of the kernel may copy: large, yet short enough for the process to be stopped in between.
constexpr size_t kRangeSize = 64 * 1024 * 1024;

int writeAll(int file, const char* bytes, size_t size) {
    while (size > 0) {
        ssize_t written = ::write(file, bytes, size);
        if (written < 0 && errno == EINTR) continue;
        if (written < 0) return errno;
        bytes += written;
        size -= static_cast<size_t>(written);
    }
    return 0;
}

int copyThroughBuffer(int source, int destination) {
    auto buffer = std::make_unique<char[]>(kBufferSize);
    for (;;) {
        ssize_t count = ::read(source, buffer.get(), kBufferSize);
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) return errno;
        if (count == 0) return 0;
        if (int error = writeAll(destination, buffer.get(), static_cast<size_t>(count))) return error;
    }
}

int copyBytes(int source, int destination) {
    for (;;) {
        ssize_t count = ::copy_file_range(source, nullptr, destination, nullptr, kRangeSize, 0);
        if (count > 0) continue;
        if (count < 0 && errno == EINTR) continue;
        // Files of the kernel report no bytes here, and some file systems cannot do it at all: what is left
        // goes through memory from where the call stopped. True errors show there again.
        return copyThroughBuffer(source, destination);
    }
}

// File systems without modes refuse what they cannot keep.
int setMode(int file, const struct stat& like) {
    return ::fchmod(file, like.st_mode & 0777) == 0 || errno == EPERM || errno == ENOTSUP ? 0 : errno;
}

int fillCopy(int source, int destination, const struct stat& status) {
    if (int error = copyBytes(source, destination)) return error;
    const timespec times[2] = {status.st_atim, status.st_mtim};
    if (int error = setMode(destination, status)) return error;
    return ::futimens(destination, times) == 0 ? 0 : errno;
}

// What a file that is about to be replaced hands on to its successor.
int takeOver(int file, const std::string& target) {
    struct stat status;
    if (::stat(target.c_str(), &status) != 0) return errno == ENOENT ? 0 : errno;
    if (S_ISDIR(status.st_mode)) return EISDIR;
    if (!S_ISREG(status.st_mode)) return EINVAL;
    if (::access(target.c_str(), W_OK) != 0) return errno;
    return setMode(file, status);
}

int fillReplacement(CFileHandle& file, const std::string& beside, const std::string& target, const void* data,
                    size_t size) {
    if (int error = takeOver(file.get(), target)) return error;
    if (int error = writeAll(file.get(), static_cast<const char*>(data), size)) return error;
    if (::fsync(file.get()) != 0 || !file.close()) return errno;
    return ::rename(beside.c_str(), target.c_str()) == 0 ? 0 : errno;
}

// After a power failure the folder may else still tell the old name. No more can be done where it refuses.
void syncFolderOf(const std::string& file) {
    const CFileHandle folder(
        ::open(file.substr(0, file.rfind('/') + 1).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.isOpen()) ::fsync(folder.get());
}

bool isThere(const std::string& path) {
    struct stat status;
    return ::lstat(path.c_str(), &status) == 0;
}

} // namespace

int copyRegularFile(const std::string& source, const std::string& destination) {
    // Non-blocking, so that a pipe with that name does not hold the caller until somebody writes to it.
    CFileHandle in(::open(source.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    if (!in.isOpen()) return errno;
    struct stat status;
    if (::fstat(in.get(), &status) != 0) return errno;
    if (S_ISDIR(status.st_mode)) return EISDIR;
    if (!S_ISREG(status.st_mode)) return EINVAL;

    CFileHandle out(::open(destination.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
    if (!out.isOpen()) return errno;
    int error = fillCopy(in.get(), out.get(), status);
    if (!out.close() && error == 0) error = errno;
    if (error != 0) ::unlink(destination.c_str());
    return error;
}

int renameWithoutReplacing(const std::string& source, const std::string& destination) {
    if (::renameat2(AT_FDCWD, source.c_str(), AT_FDCWD, destination.c_str(), RENAME_NOREPLACE) == 0) return 0;
    if (errno != EINVAL && errno != ENOSYS) return errno;
    // A file system without that flag. EINVAL also means a folder that is moved into itself; the plain call
    // reports that again.
    if (isThere(destination)) return EEXIST;
    return ::rename(source.c_str(), destination.c_str()) == 0 ? 0 : errno;
}

int fillAndReplace(CFileHandle file, const std::string& beside, const std::string& target, const void* data,
                   size_t size) {
    const int error = fillReplacement(file, beside, target, data, size);
    if (error == 0)
        syncFolderOf(target);
    else
        ::unlink(beside.c_str());
    return error;
}

} // namespace peru::posix
