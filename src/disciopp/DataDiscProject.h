// The project of a data disc.
#pragma once

#include "disciopp/ProjectBase.h"

namespace disciopp {

inline constexpr const char* kVirtualDataScheme = "discioppvirtualdisc";

// Also a file system: that of its virtual disc, in which folders can be created.
class DISCIOPP_API CDataDiscProject : public CProjectBase,
                                      public IDataDiscProject,
                                      public TVirtualDisc<IDisc>,
                                      public IFileSystem {
public:
    CDataDiscProject(); // an empty one; throws CDISCIOPPException

    void addFile(const P<peru::IURI>& source, const P<peru::IURI>& target, bool createFolders) override;
    // Creates the folders of a path that are missing, the outer ones first.
    void createFolders(const P<peru::IURI>& folder);

    bool handles(const P<peru::IURI>& uri) override { return files().handles(uri); }
    P<peru::IFileObject> getRoot() override { return files().getRoot(); }
    P<peru::IFileObject> getFileObject(const P<peru::IURI>& uri) override {
        return files().getFileObject(uri);
    }
    void createFolder(const P<peru::IURI>& uri) override;
    // These throw peru::CReadOnlyError.
    void setTimes(const P<peru::IURI>& uri, const P<peru::CFileTimes>& times) override {
        files().setTimes(uri, times);
    }
    void deleteFile(const P<peru::IURI>& uri) override { files().deleteFile(uri); }
    void deleteEmptyFolder(const P<peru::IURI>& uri) override { files().deleteEmptyFolder(uri); }
    void deleteFolder(const P<peru::IURI>& uri) override { files().deleteFolder(uri); }
    void deleteUndoable(const P<peru::IURI>& uri) override { files().deleteUndoable(uri); }
    void copyFile(const P<peru::IURI>& source, const P<peru::IURI>& destination) override {
        files().copyFile(source, destination);
    }
    void copyLink(const P<peru::IURI>& source, const P<peru::IURI>& destination) override {
        files().copyLink(source, destination);
    }
    void startFolder(const P<peru::IURI>& source, const P<peru::IURI>& destination) override {
        files().startFolder(source, destination);
    }
    void finishFolder(const P<peru::IURI>& source, const P<peru::IURI>& destination) override {
        files().finishFolder(source, destination);
    }
    bool tryMove(const P<peru::IURI>& source, const P<peru::IURI>& destination) override {
        return files().tryMove(source, destination);
    }
    bool isWithin(const P<peru::IURI>& uri, const P<peru::IURI>& folder) override {
        return files().isWithin(uri, folder);
    }
    void commit(const P<peru::IURI>& uri) override { files().commit(uri); }

protected:
    ~CDataDiscProject() override;

    IDisc& disc() override { return *m_disc; }

private:
    IFileSystem& files() { return *m_files; }

    const P<IFileSystem> m_files;
};

} // namespace disciopp
