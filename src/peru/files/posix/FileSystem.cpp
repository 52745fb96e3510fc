#include "peru/files/posix/FileSystem.h"

#include "peru/Errors.h"
#include "peru/files/posix/FileOperations.h"
#include "peru/files/posix/FileSystemFileObject.h"
#include "peru/files/posix/FileTimes.h"
#include "peru/posix/PlatformFile.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IDesktop.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <sys/stat.h>
#include <unistd.h>

namespace peru::posix {
namespace {

// Throws an error whose text names one file and the system's reason.
[[noreturn]] void throwError(const char* key, const char* text, const char* placeholder, const P<IURI>& uri,
                             int error) {
    throw CFileError(localize(key, text, {{placeholder, getShownName(uri)}, {"%MSG%", getSystemText(error)}}),
                     uri);
}

[[noreturn]] void throwDeleteFolderError(const P<IURI>& uri, int error) {
    throwError("peru.CFileSystem.DeleteFolderFailed", "Error deleting the folder '%FOLDER%' (%MSG%).",
               "%FOLDER%", uri, error);
}

[[noreturn]] void throwCopyError(const P<IURI>& source, const P<IURI>& destination, int error) {
    throw CFileError(localize("peru.CSystem.CopyFileFailed",
                              "Error copying file '%SRC%' to '%DEST%' (%MSG%).",
                              {{"%SRC%", getShownName(source)},
                               {"%DEST%", getShownName(destination)},
                               {"%MSG%", getSystemText(error)}}),
                     source);
}

void makeFolder(const P<IURI>& uri, mode_t mode) {
    if (::mkdir(toPath(uri).c_str(), mode) == 0) return;
    throwError("peru.CFileSystem.CreateFolderFailed", "Error creating the folder '%DIR%' (%MSG%).", "%DIR%",
               uri, errno);
}

} // namespace

bool CFileSystem::handles(const P<IURI>& uri) {
    return !tryToPath(uri).empty();
}

P<IFileObject> CFileSystem::getRoot() {
    return getFileObject(toURI("/"));
}

P<IFileObject> CFileSystem::getFileObject(const P<IURI>& uri) {
    return CFileSystemFileObject::find(toPath(uri));
}

void CFileSystem::setTimes(const P<IURI>& uri, const P<peru::CFileTimes>& times) {
    timespec values[2];
    make<CFileTimes>(times)->toTimespec(values);
    if (::utimensat(AT_FDCWD, toPath(uri).c_str(), values, 0) == 0) return;
    throwError("peru.CFileSystem.SetTimesFailed", "Error setting the times of '%FILE%' (%MSG%).", "%FILE%",
               uri, errno);
}

void CFileSystem::createFolder(const P<IURI>& uri) {
    makeFolder(uri, 0777);
}

void CFileSystem::deleteFile(const P<IURI>& uri) {
    if (::unlink(toPath(uri).c_str()) == 0) return;
    throwError("peru.CFileSystem.DeleteFileFailed", "Error deleting the file '%FILE%' (%MSG%).", "%FILE%",
               uri, errno);
}

void CFileSystem::deleteEmptyFolder(const P<IURI>& uri) {
    if (::rmdir(toPath(uri).c_str()) != 0) throwDeleteFolderError(uri, errno);
}

void CFileSystem::deleteFolder(const P<IURI>& uri) {
    std::string path = toPath(uri);
    struct stat status;
    if (::lstat(path.c_str(), &status) != 0) throwDeleteFolderError(uri, errno);
    if (!S_ISDIR(status.st_mode)) throwDeleteFolderError(uri, ENOTDIR);
    // The root itself cannot be deleted, but all its content would be. A path may name it in several ways,
    // such as "/." after unescaping.
    struct stat root;
    if (::stat("/", &root) != 0) throwDeleteFolderError(uri, errno);
    if (status.st_dev == root.st_dev && status.st_ino == root.st_ino) throwDeleteFolderError(uri, EBUSY);
    std::error_code error;
    std::filesystem::remove_all(path, error);
    if (error) throwDeleteFolderError(uri, error.value());
}

void CFileSystem::deleteUndoable(const P<IURI>& uri) {
    int error = 0;
    if (getDesktop()->moveToTrash(toPath(uri), error)) return;
    throw CFileError(format(localize("peru.CFileSystem.shellDeleteUndoable", "shell error %d"), error), uri);
}

void CFileSystem::copyFile(const P<IURI>& source, const P<IURI>& destination) {
    getSystem()->copyFile(source, destination);
}

void CFileSystem::copyLink(const P<IURI>& source, const P<IURI>& destination) {
    std::string from = toPath(source);
    std::string to = toPath(destination);
    std::string target(PATH_MAX, '\0');
    ssize_t length = ::readlink(from.c_str(), target.data(), target.size());
    if (length < 0) throwCopyError(source, destination, errno);
    target.resize(static_cast<size_t>(length));
    if (::symlink(target.c_str(), to.c_str()) != 0) throwCopyError(source, destination, errno);
    struct stat status;
    if (::lstat(from.c_str(), &status) != 0) return;
    // Not every file system stores times of links, and nothing depends on them.
    const timespec times[2] = {status.st_atim, status.st_mtim};
    static_cast<void>(::utimensat(AT_FDCWD, to.c_str(), times, AT_SYMLINK_NOFOLLOW));
}

void CFileSystem::startFolder(const P<IURI>& source, const P<IURI>& destination) {
    makeFolder(destination, 0700);
}

void CFileSystem::finishFolder(const P<IURI>& source, const P<IURI>& destination) {
    struct stat status;
    if (::stat(toPath(source).c_str(), &status) != 0) throwCopyError(source, destination, errno);
    CFileHandle folder(::open(toPath(destination).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!folder.isOpen()) throwCopyError(source, destination, errno);
    const timespec times[2] = {status.st_atim, status.st_mtim};
    // File systems without modes refuse to set one.
    if (::fchmod(folder.get(), status.st_mode & 01777) != 0 && errno != EPERM && errno != ENOTSUP)
        throwCopyError(source, destination, errno);
    if (::futimens(folder.get(), times) != 0) throwCopyError(source, destination, errno);
}

bool CFileSystem::tryMove(const P<IURI>& source, const P<IURI>& destination) {
    std::string from = toPath(source);
    int error = renameWithoutReplacing(from, toPath(destination));
    if (error == 0) return true;
    if (error == EXDEV) return false;
    struct stat status;
    bool folder = ::lstat(from.c_str(), &status) == 0 && S_ISDIR(status.st_mode);
    throw CFileError(localize(folder ? "peru.CSystem.MoveFolderFailed" : "peru.CSystem.MoveFileFailed",
                              folder ? "Error moving folder '%SRC%' to '%DEST%'."
                                     : "Error moving file '%SRC%' to '%DEST%'.",
                              {{"%SRC%", getShownName(source)}, {"%DEST%", getShownName(destination)}}),
                     source);
}

bool CFileSystem::isWithin(const P<IURI>& uri, const P<IURI>& folder) {
    struct stat outer;
    if (::stat(toPath(folder).c_str(), &outer) != 0) return false;
    std::error_code error;
    std::filesystem::path path =
        std::filesystem::weakly_canonical(std::filesystem::absolute(toPath(uri)), error);
    if (error) return false;
    // Compares identity rather than names: links and mounts give one folder several names.
    for (;; path = path.parent_path()) {
        struct stat status;
        if (::stat(path.c_str(), &status) == 0 && status.st_dev == outer.st_dev &&
            status.st_ino == outer.st_ino)
            return true;
        if (!path.has_relative_path()) return false;
    }
}

void CFileSystem::commit(const P<IURI>& uri) {
    std::string path = toPath(uri);
    CFileHandle file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOFOLLOW));
    // For anything that cannot be opened, such as a link, use its folder.
    if (!file.isOpen())
        file = CFileHandle(::open(std::filesystem::absolute(path).parent_path().c_str(),
                                  O_RDONLY | O_CLOEXEC | O_DIRECTORY));
    if (!file.isOpen() || ::syncfs(file.get()) != 0)
        throwError("peru.CFileSystem.CommitFailed", "Error writing '%FILE%' to the medium (%MSG%).", "%FILE%",
                   uri, errno);
}

} // namespace peru::posix

namespace peru {

P<IFileSystem> createDiskFileSystem() {
    return make<posix::CFileSystem>();
}

} // namespace peru
