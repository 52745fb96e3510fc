// Whole-file operations on any URI.
#pragma once

#include "peru/files/IFileSystem.h"

namespace peru {

// Finds the file system of each URI among those that are mounted; the disks are there from the start. Safe
// from any thread. A URI of no file system does not exist, and every other operation on it throws
// CURITypeNotSupportedError; what is not there gives CFileNotFoundError where no other error is told.
class PERU_API IFileSystemManager : public virtual IBase {
public:
    virtual bool exists(const P<IURI>& uri) = 0;   // also a link that leads nowhere
    virtual bool isFile(const P<IURI>& uri) = 0;   // links followed
    virtual bool isFolder(const P<IURI>& uri) = 0; // links followed
    virtual int64_t getFileSize(const P<IURI>& uri) = 0;
    // With its parents. A folder that exists is fine; on failure none of those made stays.
    virtual void createFolder(const P<IURI>& uri) = 0;
    virtual void deleteFile(const P<IURI>& uri) = 0;
    virtual void deleteFolder(const P<IURI>& uri) = 0; // with everything in it; follows no links
    // A file, or a folder with everything in it. Links below the source are copied as links. Nothing is
    // replaced, and a failure leaves nothing at the destination.
    virtual void copy(const P<IURI>& source, const P<IURI>& destination) = 0;
    // By name where that can be, else by copy and delete. Until the copy is complete and on the medium the
    // source is untouched; a failure before that removes the copy.
    virtual void move(const P<IURI>& source, const P<IURI>& destination) = 0;
    virtual P<IFileObjectCursor> enumerate(const P<IURI>& folder) = 0;
    virtual P<IFileObject> getFileObject(const P<IURI>& uri) = 0; // empty when there is nothing
    virtual P<CFileTimes> getTimes(const P<IURI>& uri) = 0;
    // A time that is unknown stays. The creation time stays where the platform cannot set it.
    virtual void setTimes(const P<IURI>& uri, const P<CFileTimes>& times) = 0;
    virtual SFileAttributes getAttributes(const P<IURI>& uri) = 0;
    virtual void deleteUndoable(const P<IURI>& uri) = 0; // into the waste bin

    // Asked before those that were mounted earlier, by IFileSystem::handles.
    virtual void mount(const P<IFileSystem>& fileSystem) = 0;
    // For every URI of the scheme, whatever `handles` says.
    virtual void mountScheme(const CStringArg& scheme, const P<IFileSystem>& fileSystem) = 0;
    virtual void unmount(const P<IFileSystem>& fileSystem) = 0;
    virtual P<IFileSystem> getFileSystem(const P<IURI>& uri) = 0; // empty when there is none
};

PERU_API P<IFileSystemManager> getFileSystemManager();

} // namespace peru
