// Whole-file operations on any URI.
#pragma once

#include "peru/files/IFileSystem.h"

namespace peru {

// Finds the file system of each URI among the mounted ones; the disks are mounted from the start.
// Thread-safe. A URI that belongs to no file system does not exist, and every other operation on it throws
// CURITypeNotSupportedError. A missing file gives CFileNotFoundError unless stated otherwise.
class PERU_API IFileSystemManager : public virtual IBase {
public:
    virtual bool exists(const P<IURI>& uri) = 0;   // true for a dangling link
    virtual bool isFile(const P<IURI>& uri) = 0;   // links followed
    virtual bool isFolder(const P<IURI>& uri) = 0; // links followed
    virtual int64_t getFileSize(const P<IURI>& uri) = 0;
    // Creates missing parents too. An existing folder is not an error; on failure all created folders are
    // removed.
    virtual void createFolder(const P<IURI>& uri) = 0;
    virtual void deleteFile(const P<IURI>& uri) = 0;
    virtual void deleteFolder(const P<IURI>& uri) = 0; // with all its content; links are not followed
    // Copies a file, or a folder with all its content. Links below the source are copied as links. Nothing is
    // replaced, and a failure leaves nothing at the destination.
    virtual void copy(const P<IURI>& source, const P<IURI>& destination) = 0;
    // Renames where possible, otherwise copies and deletes. The source is untouched until the copy is
    // complete and on the disk; a failure before that removes the copy.
    virtual void move(const P<IURI>& source, const P<IURI>& destination) = 0;
    virtual P<IFileObjectCursor> enumerate(const P<IURI>& folder) = 0;
    virtual P<IFileObject> getFileObject(const P<IURI>& uri) = 0; // empty if nothing exists there
    virtual P<CFileTimes> getTimes(const P<IURI>& uri) = 0;
    // Unknown times are not changed, nor is the creation time where the platform cannot set it.
    virtual void setTimes(const P<IURI>& uri, const P<CFileTimes>& times) = 0;
    virtual SFileAttributes getAttributes(const P<IURI>& uri) = 0;
    virtual void deleteUndoable(const P<IURI>& uri) = 0; // into the trash

    // Selected by IFileSystem::handles; later mounts take precedence over earlier ones.
    virtual void mount(const P<IFileSystem>& fileSystem) = 0;
    // For every URI of the scheme, regardless of `handles`.
    virtual void mountScheme(const CStringArg& scheme, const P<IFileSystem>& fileSystem) = 0;
    virtual void unmount(const P<IFileSystem>& fileSystem) = 0;
    virtual P<IFileSystem> getFileSystem(const P<IURI>& uri) = 0; // empty if there is none
};

PERU_API P<IFileSystemManager> getFileSystemManager();

} // namespace peru
