#include "peru/files/posix/FileOperations.h"

#include "peru/posix/PlatformFile.h"
#include "peru/system/RandomNumberGenerator.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <fcntl.h>
#include <memory>
#include <sys/stat.h>
#include <unistd.h>

namespace peru::posix {
namespace {

constexpr int kUniqueAttempts = 100;
constexpr size_t kBufferSize = 256 * 1024;
// Bytes per copying system call: large, but small enough for the process to be interrupted in between.
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
        // Virtual files of the kernel report no bytes here, and some file systems do not support the call:
        // the rest is copied through a buffer, where genuine errors occur again.
        return copyThroughBuffer(source, destination);
    }
}

// File systems without modes refuse to set one.
int setMode(int file, const struct stat& like) {
    return ::fchmod(file, like.st_mode & 0777) == 0 || errno == EPERM || errno == ENOTSUP ? 0 : errno;
}

int fillCopy(int source, int destination, const struct stat& status) {
    if (int error = copyBytes(source, destination)) return error;
    const timespec times[2] = {status.st_atim, status.st_mtim};
    if (int error = setMode(destination, status)) return error;
    return ::futimens(destination, times) == 0 ? 0 : errno;
}

std::string makeUniqueWord() {
    static const char kDigits[] = "0123456789abcdefghijklmnopqrstuvwxyz";
    const P<CMersenneTwisterRandomNumberGenerator> random = getRandomNumberGenerator();
    std::string word;
    for (int i = 0; i < 12; ++i) word += kDigits[random->getNextBelow(36)];
    return word;
}

int writeAllAt(int file, const char* bytes, size_t size, off_t offset) {
    while (size > 0) {
        const ssize_t written = ::pwrite(file, bytes, size, offset);
        if (written < 0 && errno == EINTR) continue;
        if (written < 0) return errno;
        bytes += written;
        offset += written;
        size -= static_cast<size_t>(written);
    }
    return 0;
}

int copyRangeThroughBuffer(int source, off_t from, int destination, off_t to, int64_t size, int64_t& copied) {
    auto buffer = std::make_unique_for_overwrite<char[]>(kBufferSize);
    while (copied < size) {
        const auto wanted = static_cast<size_t>(std::min<int64_t>(size - copied, kBufferSize));
        const ssize_t count = ::pread(source, buffer.get(), wanted, from + copied);
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) return errno;
        if (count == 0) return 0;
        if (int error = writeAllAt(destination, buffer.get(), static_cast<size_t>(count), to + copied))
            return error;
        copied += count;
    }
    return 0;
}

bool isThere(const std::string& path) {
    struct stat status;
    return ::lstat(path.c_str(), &status) == 0;
}

} // namespace

int copyRegularFile(const std::string& source, const std::string& destination) {
    // Non-blocking, so that opening a FIFO does not wait for a writer.
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
    // The file system does not support the flag. EINVAL also means that a folder would be moved into itself;
    // the plain call reports that again.
    if (isThere(destination)) return EEXIST;
    return ::rename(source.c_str(), destination.c_str()) == 0 ? 0 : errno;
}

int copyRange(int source, int64_t sourceOffset, int destination, int64_t offset, int64_t size,
              int64_t& copied) {
    copied = 0;
    while (copied < size) {
        off_t from = sourceOffset + copied;
        off_t to = offset + copied;
        const auto wanted = static_cast<size_t>(std::min<int64_t>(size - copied, kRangeSize));
        const ssize_t count = ::copy_file_range(source, &from, destination, &to, wanted, 0);
        if (count < 0 && errno == EINTR) continue;
        if (count <= 0) break;
        copied += count;
    }
    return copyRangeThroughBuffer(source, sourceOffset, destination, offset, size, copied);
}

std::string createUnique(const std::string& folder, const std::string& prefix, const std::string& suffix,
                         int& error, const std::function<int(const std::string&)>& create) {
    error = EINVAL;
    // A separator would lead out of the folder.
    if ((prefix + suffix).find('/') != std::string::npos) return "";
    error = EEXIST;
    for (int i = 0; i < kUniqueAttempts && error == EEXIST; ++i) {
        std::string path = folder + (folder.ends_with('/') ? "" : "/") + prefix + makeUniqueWord() + suffix;
        error = create(path);
        if (error == 0) return path;
    }
    return "";
}

} // namespace peru::posix
