// Base class of read-only file systems, such as discs.
#pragma once

#include "peru/files/IFileSystem.h"

namespace peru {

// Every modifying operation throws CReadOnlyError.
class PERU_API CReadOnlyFileSystem : public CObject, public virtual IFileSystem {
protected:
    ~CReadOnlyFileSystem() override;

public:
    void setTimes(const P<IURI>& uri, const P<CFileTimes>& times) override;
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
    bool isWithin(const P<IURI>& uri, const P<IURI>& folder) override; // compares the text of the paths
    void commit(const P<IURI>& uri) override;

private:
    [[noreturn]] static void refuse(const P<IURI>& uri);
};

} // namespace peru
