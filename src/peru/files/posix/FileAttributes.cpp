#include "peru/files/posix/FileAttributes.h"

#include <cerrno>
#include <cstring>
#include <string>
#include <string_view>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>

namespace peru::posix {
namespace {

constexpr char kAccessList[] = "system.posix_acl_access";
constexpr std::string_view kLabel = "security.selinux";

// Capabilities and checksums belong to the old content; the kernel drops them on writing, too.
bool isTakenOver(std::string_view name) {
    return !name.starts_with("security.") || name == kLabel;
}

// The names, each terminated by a zero byte.
std::string listAttributes(int file) {
    for (;;) {
        const ssize_t size = ::flistxattr(file, nullptr, 0);
        if (size <= 0) return {};
        std::string names(static_cast<size_t>(size), '\0');
        const ssize_t count = ::flistxattr(file, names.data(), names.size());
        if (count < 0 && errno == ERANGE) continue;
        names.resize(count > 0 ? static_cast<size_t>(count) : 0);
        return names;
    }
}

bool readAttribute(int file, const char* name, std::string& value) {
    for (;;) {
        const ssize_t size = ::fgetxattr(file, name, nullptr, 0);
        if (size < 0) return false;
        value.resize(static_cast<size_t>(size));
        const ssize_t count = ::fgetxattr(file, name, value.data(), value.size());
        if (count < 0 && errno == ERANGE) continue;
        value.resize(count > 0 ? static_cast<size_t>(count) : 0);
        return count >= 0;
    }
}

bool isRefusal(int error) {
    return error == EPERM || error == EACCES || error == ENOTSUP || error == ENOSYS;
}

int copyAttributes(int from, int to) {
    // An access list inherited from the folder could admit users whom the old file's list kept out.
    if (::fremovexattr(to, kAccessList) != 0 && errno != ENODATA && !isRefusal(errno)) return errno;
    const std::string names = listAttributes(from);
    std::string value;
    for (const char* name = names.c_str(); name < names.c_str() + names.size();
         name += std::strlen(name) + 1) {
        if (!isTakenOver(name) || !readAttribute(from, name, value)) continue;
        if (::fsetxattr(to, name, value.data(), value.size(), 0) != 0 && !isRefusal(errno)) return errno;
    }
    return 0;
}

} // namespace

int takeOverAttributes(int from, int to) {
    struct stat old;
    struct stat fresh;
    if (::fstat(from, &old) != 0 || ::fstat(to, &fresh) != 0) return errno;
    mode_t mode = old.st_mode & 07777;
    if (old.st_uid != fresh.st_uid || old.st_gid != fresh.st_gid) {
        if (::fchown(to, old.st_uid, old.st_gid) != 0 &&
            ::fchown(to, static_cast<uid_t>(-1), old.st_gid) != 0) {
            // The group changes: it only gets the permissions of others.
            const mode_t others = mode & 07;
            mode = (mode & ~070u) | (mode & others << 3);
        }
        if (::fstat(to, &fresh) != 0) return errno;
        if (fresh.st_uid != old.st_uid || fresh.st_gid != old.st_gid) mode &= 01777;
    }
    // Setting the access list changes the mode too, so the mode is set last.
    if (int error = copyAttributes(from, to)) return error;
    return ::fchmod(to, mode) == 0 || isRefusal(errno) ? 0 : errno;
}

} // namespace peru::posix
