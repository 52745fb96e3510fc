// One tree of file objects.
#pragma once

#include "peru/files/IFileObject.h"

namespace peru {

// Every URI given to it is one that it handles. Safe from any thread. What an operation does, it does wholly
// or not at all, deleteFolder excepted; failures are CFileError.
class PERU_API IFileSystem : public virtual IBase {
public:
    virtual bool handles(const P<IURI>& uri) = 0;
    virtual P<IFileObject> getRoot() = 0;
    // Empty when there is nothing. A link that leads nowhere is something.
    virtual P<IFileObject> getFileObject(const P<IURI>& uri) = 0;

    virtual void setTimes(const P<IURI>& uri, const P<CFileTimes>& times) = 0;
    virtual void createFolder(const P<IURI>& uri) = 0; // in a folder that exists
    virtual void deleteFile(const P<IURI>& uri) = 0;   // or a link, never what it leads to
    virtual void deleteEmptyFolder(const P<IURI>& uri) = 0;
    // With everything in it. Links in it are removed and not followed.
    virtual void deleteFolder(const P<IURI>& uri) = 0;
    // So that the user can get it back, such as from a waste bin; fails rather than to delete for good.
    virtual void deleteUndoable(const P<IURI>& uri) = 0;

    // --- Within this file system; none replaces anything ---
    virtual void copyFile(const P<IURI>& source, const P<IURI>& destination) = 0; // what a link leads to
    virtual void copyLink(const P<IURI>& source, const P<IURI>& destination) = 0; // the link itself
    // An empty folder that nobody else can look into until finishFolder gives it the rights and times of its
    // source, after its children have come.
    virtual void startFolder(const P<IURI>& source, const P<IURI>& destination) = 0;
    virtual void finishFolder(const P<IURI>& source, const P<IURI>& destination) = 0;
    // A file, folder or link by its name alone. False, with nothing done, where that needs a copy.
    virtual bool tryMove(const P<IURI>& source, const P<IURI>& destination) = 0;
    // Whether `uri`, which need not exist, is `folder` or would lie below it.
    virtual bool isWithin(const P<IURI>& uri, const P<IURI>& folder) = 0;
    // Returns when what was written around `uri` would outlive a power cut.
    virtual void commit(const P<IURI>& uri) = 0;
};

// The disks of this machine: "file" and relative URIs.
PERU_API P<IFileSystem> createDiskFileSystem();

} // namespace peru
