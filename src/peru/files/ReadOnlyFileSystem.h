// The base of file systems that can only be looked at, such as discs.
#pragma once

#include "peru/files/IFileSystem.h"

namespace peru {

// Every operation that writes throws CReadOnlyError.
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
    bool isWithin(const P<IURI>& uri, const P<IURI>& folder) override; // by the text of the paths
    void commit(const P<IURI>& uri) override;

private:
    [[noreturn]] static void refuse(const P<IURI>& uri);
};

} // namespace peru
