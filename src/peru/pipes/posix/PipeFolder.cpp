#include "peru/pipes/posix/PipeFolder.h"

#include "peru/Errors.h"
#include "peru/pipes/PipeName.h"
#include "peru/strings/IStringLocalizer.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/un.h>
#include <unistd.h>

namespace peru::posix {

namespace {

constexpr char kRuntimeName[] = "/tonewright-pipes";

[[noreturn]] void throwError(const char* key, const char* text, const std::string& name, int error) {
    throw CError(
        localize(key, text, {{"%MSG%", CString::fromUTF8(name)}, {"%ERRORDESC%", getSystemText(error)}}));
}

[[noreturn]] void throwFolderError(const std::string& path, int error) {
    throwError("peru.CPipeFolder.folderError", "Error opening the pipe folder '%MSG%' (%ERRORDESC%).", path,
               error);
}

[[noreturn]] void throwListenError(const std::string& name, int error) {
    throwError("peru.CPipeFolder.listenError", "Error creating the pipe '%MSG%' (%ERRORDESC%).", name, error);
}

// An absolute path from the environment; a relative one would depend on the working directory.
std::string getAbsolutePath(const char* variable) {
    const char* value = std::getenv(variable);
    return value && value[0] == '/' ? value : "";
}

// Returns a folder that is not open, with errno, where the folder does not exist and cannot be created.
CFileHandle tryOpen(const std::string& path) {
    if (::mkdir(path.c_str(), 0700) != 0 && errno != EEXIST) return CFileHandle();
    CFileHandle folder(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    if (!folder.isOpen()) throwFolderError(path, errno);
    struct stat status;
    if (::fstat(folder.get(), &status) != 0) throwFolderError(path, errno);
    if (status.st_uid != ::geteuid() || (status.st_mode & 0777) != 0700)
        throw CError(localize("peru.CPipeFolder.notPrivate",
                              "The pipe folder '%MSG%' must belong to the user and be accessible to nobody "
                              "else.",
                              {{"%MSG%", CString::fromUTF8(path)}}));
    return folder;
}

CFileHandle createSocket(int type) {
    return CFileHandle(::socket(AF_UNIX, type | SOCK_CLOEXEC, 0));
}

// The path of a name in the folder, through the folder's descriptor.
sockaddr_un getAddress(int folder, const std::string& name) {
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    constexpr size_t kLongestPrefix = sizeof "/proc/self/fd/2147483647/";
    static_assert(kLongestPrefix + static_cast<size_t>(kLongestPipeName) <= sizeof address.sun_path);
    std::snprintf(address.sun_path, sizeof address.sun_path, "/proc/self/fd/%d/%s", folder, name.c_str());
    return address;
}

// Whether a server of the name exists, without connecting to it: a socket of another type is refused with
// EPROTOTYPE if the file belongs to a socket, and with ECONNREFUSED if that socket is gone.
bool isInUse(const sockaddr_un& address) {
    const CFileHandle probe = createSocket(SOCK_DGRAM);
    return ::connect(probe.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0 ||
           errno != ECONNREFUSED;
}

} // namespace

CPipeFolder CPipeFolder::open() {
    const std::string runtime = getAbsolutePath("XDG_RUNTIME_DIR");
    if (!runtime.empty()) {
        CFileHandle folder = tryOpen(runtime + kRuntimeName);
        if (folder.isOpen()) return CPipeFolder(std::move(folder));
    }
    std::string temporary = getAbsolutePath("TMPDIR");
    if (temporary.empty()) temporary = "/tmp";
    const std::string path = temporary + kRuntimeName + "-" + std::to_string(::geteuid());
    CFileHandle folder = tryOpen(path);
    if (!folder.isOpen()) throwFolderError(path, errno);
    return CPipeFolder(std::move(folder));
}

CFileHandle CPipeFolder::connect(const std::string& name, int milliseconds) const {
    CFileHandle socket = createSocket(SOCK_STREAM);
    if (!socket.isOpen()) return socket;
    const timeval limit = {milliseconds / 1000, milliseconds % 1000 * 1000};
    const timeval none = {0, 0};
    const sockaddr_un address = getAddress(m_folder.get(), name);
    int result;
    ::setsockopt(socket.get(), SOL_SOCKET, SO_SNDTIMEO, &limit, sizeof limit);
    do result = ::connect(socket.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address);
    while (result != 0 && errno == EINTR);
    ::setsockopt(socket.get(), SOL_SOCKET, SO_SNDTIMEO, &none, sizeof none);
    return result == 0 ? std::move(socket) : CFileHandle();
}

CListeningPipe::CListeningPipe(const std::string& name, int backlog)
    : m_folder(CPipeFolder::open()), m_name(name), m_socket(createSocket(SOCK_STREAM | SOCK_NONBLOCK)) {
    const int folder = m_folder.m_folder.get();
    if (!m_socket.isOpen()) throwListenError(name, errno);
    const sockaddr_un address = getAddress(folder, name);
    const auto* generic = reinterpret_cast<const sockaddr*>(&address);
    // The file takes over the mode of the socket.
    if (::fchmod(m_socket.get(), 0600) != 0) throwListenError(name, errno);

    // One server at a time may replace a file, so that none removes what another has just created. A
    // descriptor of its own releases the lock at the end of this block.
    const CFileHandle lock(::openat(folder, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    while (::flock(lock.get(), LOCK_EX) != 0)
        if (errno != EINTR) throwListenError(name, errno);
    if (::bind(m_socket.get(), generic, sizeof address) != 0) {
        if (errno != EADDRINUSE) throwListenError(name, errno);
        struct stat found;
        const bool isSocket =
            ::fstatat(folder, name.c_str(), &found, AT_SYMLINK_NOFOLLOW) == 0 && S_ISSOCK(found.st_mode);
        if (!isSocket || isInUse(address)) throwListenError(name, EADDRINUSE);
        if (::unlinkat(folder, name.c_str(), 0) != 0) throwListenError(name, errno);
        if (::bind(m_socket.get(), generic, sizeof address) != 0) throwListenError(name, errno);
    }
    struct stat status;
    if (::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0 ||
        ::listen(m_socket.get(), backlog) != 0) {
        const int error = errno;
        ::unlinkat(folder, name.c_str(), 0);
        throwListenError(name, error);
    }
    m_identity = status.st_ino;
}

CListeningPipe::~CListeningPipe() {
    // Before the socket is closed, while the name cannot belong to another server, unless somebody has
    // removed the file by hand.
    const int folder = m_folder.m_folder.get();
    struct stat status;
    if (::fstatat(folder, m_name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 && status.st_ino == m_identity)
        ::unlinkat(folder, m_name.c_str(), 0);
}

} // namespace peru::posix
