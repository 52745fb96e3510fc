// The file systems of this machine.
#pragma once

#include "peru/files/IFileSystem.h"

namespace peru::posix {

// Stateless; thread-safe.
class CFileSystem : public CObject, public IFileSystem {
public:
    bool handles(const P<IURI>& uri) override;
    P<IFileObject> getRoot() override;
    P<IFileObject> getFileObject(const P<IURI>& uri) override;
    // The creation time cannot be set on this platform.
    void setTimes(const P<IURI>& uri, const P<peru::CFileTimes>& times) override;
    void createFolder(const P<IURI>& uri) override;
    void deleteFile(const P<IURI>& uri) override;
    void deleteEmptyFolder(const P<IURI>& uri) override;
    void deleteFolder(const P<IURI>& uri) override;
    void deleteUndoable(const P<IURI>& uri) override;
    void copyFile(const P<IURI>& source, const P<IURI>& destination) override;
    void copyLink(const P<IURI>& source, const P<IURI>& destination) override;
    void startFolder(const P<IURI>& source, const P<IURI>& destination) override;
    void finishFolder(const P<IURI>& source, const P<IURI>& destination) override;
    bool tryMove(const P<IURI>& source, const P<IURI>& destination) override;
    bool isWithin(const P<IURI>& uri, const P<IURI>& folder) override;
    // Syncs the whole volume.
    void commit(const P<IURI>& uri) override;
};

} // namespace peru::posix
