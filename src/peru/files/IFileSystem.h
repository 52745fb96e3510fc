// One tree of file objects.
#pragma once

#include "peru/files/IFileObject.h"

namespace peru {

// Callers only pass URIs that it handles. Thread-safe. Operations other than deleteFolder either succeed
// completely or change nothing; failures throw CFileError.
class PERU_API IFileSystem : public virtual IBase {
public:
    virtual bool handles(const P<IURI>& uri) = 0;
    virtual P<IFileObject> getRoot() = 0;
    // Empty if nothing exists there. A dangling link exists.
    virtual P<IFileObject> getFileObject(const P<IURI>& uri) = 0;

    virtual void setTimes(const P<IURI>& uri, const P<CFileTimes>& times) = 0;
    virtual void createFolder(const P<IURI>& uri) = 0; // the parent must exist
    virtual void deleteFile(const P<IURI>& uri) = 0;   // or a link, never its target
    virtual void deleteEmptyFolder(const P<IURI>& uri) = 0;
    // With all its content. Links are removed, not followed.
    virtual void deleteFolder(const P<IURI>& uri) = 0;
    // So that the user can restore it, for example into the trash; fails rather than deleting permanently.
    virtual void deleteUndoable(const P<IURI>& uri) = 0;

    // --- Within this file system; none of them replaces anything ---
    virtual void copyFile(const P<IURI>& source, const P<IURI>& destination) = 0; // follows links
    virtual void copyLink(const P<IURI>& source, const P<IURI>& destination) = 0; // the link itself
    // Creates an empty folder that nobody else can read. finishFolder, called once the children have been
    // copied, sets the permissions and times of the source.
    virtual void startFolder(const P<IURI>& source, const P<IURI>& destination) = 0;
    virtual void finishFolder(const P<IURI>& source, const P<IURI>& destination) = 0;
    // Moves a file, folder or link by renaming it. Returns false, with nothing done, if a copy would be
    // needed.
    virtual bool tryMove(const P<IURI>& source, const P<IURI>& destination) = 0;
    // Whether `uri`, which need not exist, is `folder` or would be below it.
    virtual bool isWithin(const P<IURI>& uri, const P<IURI>& folder) = 0;
    // Returns once everything written at `uri` would survive a power failure.
    virtual void commit(const P<IURI>& uri) = 0;
};

// The file systems of this machine: "file" and relative URIs.
PERU_API P<IFileSystem> createDiskFileSystem();

} // namespace peru
