#include "peru/files/posix/FileSystemFileObject.h"

#include "peru/Errors.h"
#include "peru/files/posix/FileTimes.h"
#include "peru/posix/PlatformFile.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/UTF8.h"
#include "peru/system/IDesktop.h"
#include "peru/system/IPathes.h"

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace peru::posix {
namespace {

constexpr unsigned kWanted = STATX_TYPE | STATX_MODE | STATX_SIZE | STATX_ATIME | STATX_MTIME | STATX_BTIME;

timespec toTimespec(const statx_timestamp& time) {
    timespec result{};
    result.tv_sec = time.tv_sec;
    result.tv_nsec = time.tv_nsec;
    return result;
}

std::string getLastSegment(const std::string& path) {
    return path == "/" ? path : path.substr(path.rfind('/') + 1);
}

[[noreturn]] void throwFolderError(const std::string& path, int error) {
    P<IURI> uri = toURI(path);
    if (error == ENOENT) throw CFileNotFoundError(uri);
    if (error == EACCES || error == EPERM) throw CFileAccessDeniedError(uri);
    if (error == ENOTDIR)
        throw CFileError(localize("peru.win32.CFileSystemFolderCursor.notAFolder",
                                  "'%FILE%' is not a folder.", {{"%FILE%", getShownName(uri)}}),
                         uri);
    throw CFileError(localize("peru.posix.CFileSystemFolderCursor.readFailed",
                              "Error reading the folder '%FOLDER%' (%MSG%).",
                              {{"%FOLDER%", getShownName(uri)}, {"%MSG%", getSystemText(error)}}),
                     uri);
}

} // namespace

P<IFileObject> CFileSystemFileObject::find(const std::string& path) {
    P<CFileSystemFileObject> object = make<CFileSystemFileObject>();
    int error = object->look(path);
    if (error == 0) return object;
    if (error == ENOENT || error == ENOTDIR) return nullptr;
    P<IURI> uri = toURI(path);
    if (error == EACCES) throw CFileAccessDeniedError(uri);
    throw CFileError(localize("peru.CFileSystem.GetFileObjectFailed", "Error looking for '%FILE%' (%MSG%).",
                              {{"%FILE%", getShownName(uri)}, {"%MSG%", getSystemText(error)}}),
                     uri);
}

int CFileSystemFileObject::look(const std::string& path) {
    struct statx status;
    if (::statx(AT_FDCWD, path.c_str(), AT_SYMLINK_NOFOLLOW, kWanted, &status) != 0) return errno;
    m_attributes.link = S_ISLNK(status.stx_mode);
    if (m_attributes.link) {
        // A dangling link describes itself.
        struct statx target;
        if (::statx(AT_FDCWD, path.c_str(), 0, kWanted, &target) == 0) status = target;
    }
    m_path = path;
    m_file = S_ISREG(status.stx_mode);
    m_folder = S_ISDIR(status.stx_mode);
    m_size = m_file ? static_cast<int64_t>(status.stx_size) : 0;
    timespec creation = toTimespec(status.stx_btime);
    m_times = make<CFileTimes>(status.stx_mask & STATX_BTIME ? &creation : nullptr,
                               toTimespec(status.stx_atime), toTimespec(status.stx_mtime));
    std::string name = getLastSegment(path);
    m_attributes.hidden = name.starts_with('.') && name != "." && name != "..";
    m_attributes.executable = m_file && (status.stx_mode & 0111) != 0;
    // The superuser may write to everything, so check the mode as well.
    m_attributes.readOnly = (status.stx_mode & 0222) == 0 || ::access(path.c_str(), W_OK) != 0;
    return 0;
}

P<IURI> CFileSystemFileObject::getURI() {
    return m_folder ? toFolderURI(m_path) : toURI(m_path);
}

P<IString> CFileSystemFileObject::getName() {
    return CString::fromUTF8(getLastSegment(m_path));
}

P<IString> CFileSystemFileObject::getDisplayName() {
    return CString::fromUTF8(makeValidUTF8(getLastSegment(m_path)));
}

P<IString> CFileSystemFileObject::getKind() {
    if (m_folder) return CString::fromUTF8("inode/directory");
    return CString::fromUTF8(getDesktop()->findKind(m_path));
}

P<IFileObjectCursor> CFileSystemFileObject::enumerate() {
    return CFileSystemFolderCursor::open(m_path);
}

CFileSystemFolderCursor::CFileSystemFolderCursor(std::string path, DIR* folder)
    : m_path(std::move(path)), m_folder(folder) {}

P<IFileObjectCursor> CFileSystemFolderCursor::open(const std::string& path) {
    DIR* folder = ::opendir(path.c_str());
    if (!folder) throwFolderError(path, errno);
    return make<CFileSystemFolderCursor>(path, folder);
}

bool CFileSystemFolderCursor::next() {
    m_current = nullptr;
    for (;;) {
        errno = 0;
        const dirent* entry = ::readdir(m_folder.get());
        if (!entry && errno != 0) throwFolderError(m_path, errno);
        if (!entry) return false;
        if (std::strcmp(entry->d_name, ".") == 0 || std::strcmp(entry->d_name, "..") == 0) continue;
        m_current = CFileSystemFileObject::find((m_path == "/" ? "" : m_path) + "/" + entry->d_name);
        if (m_current) return true;
    }
}

P<IFileObject> CFileSystemFolderCursor::getFileObject() {
    if (!m_current) throw CInvalidObjectStateError("no child under the cursor", P<IBase>::share(this));
    return m_current;
}

void CFileSystemFolderCursor::reset() {
    m_current = nullptr;
    ::rewinddir(m_folder.get());
}

} // namespace peru::posix
